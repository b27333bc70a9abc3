#include "misc/Unicode.h"

#include "diag/Assert.h"

#include <cstdio>
#include <cstring>
#include <vector>

// The formatters build C format specs at run time on purpose.
#pragma GCC diagnostic ignored "-Wformat-nonliteral"

namespace ox::misc {

namespace {

constexpr char32_t kReplacement = 0xFFFD;

void AppendUtf16(wstring& out, char32_t cp)
{
    if (cp < 0x10000) {
        out.push_back(static_cast<wchar>(cp));
    } else {
        cp -= 0x10000;
        out.push_back(static_cast<wchar>(0xD800 + (cp >> 10)));
        out.push_back(static_cast<wchar>(0xDC00 + (cp & 0x3FF)));
    }
}

void AppendUtf8(std::string& out, char32_t cp)
{
    if (cp < 0x80) {
        out.push_back(static_cast<char>(cp));
    } else if (cp < 0x800) {
        out.push_back(static_cast<char>(0xC0 | (cp >> 6)));
        out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
    } else if (cp < 0x10000) {
        out.push_back(static_cast<char>(0xE0 | (cp >> 12)));
        out.push_back(static_cast<char>(0x80 | ((cp >> 6) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
    } else {
        out.push_back(static_cast<char>(0xF0 | (cp >> 18)));
        out.push_back(static_cast<char>(0x80 | ((cp >> 12) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | ((cp >> 6) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
    }
}

// Cuts an over-long result to the conversion limit, after the contract failure.
template <class S> void LimitLength(S& text)
{
    bool fits = text.size() <= kMaxConvertLength;
    OX_ASSERT(fits && "Probably insufficient buffer length!");
    if (!fits)
        text.resize(kMaxConvertLength);
}

} // namespace

wstring Utf8ToWide(std::string_view text)
{
    wstring out;
    out.reserve(text.size());
    const auto* s = reinterpret_cast<const unsigned char*>(text.data());
    size_t n = text.size();
    size_t i = 0;
    while (i < n) {
        unsigned char c = s[i];
        if (c < 0x80) {
            out.push_back(c);
            ++i;
            continue;
        }
        int extra;
        char32_t cp;
        char32_t min;
        if (c >= 0xC2 && c <= 0xDF) {
            extra = 1; cp = c & 0x1F; min = 0x80;
        } else if (c >= 0xE0 && c <= 0xEF) {
            extra = 2; cp = c & 0x0F; min = 0x800;
        } else if (c >= 0xF0 && c <= 0xF4) {
            extra = 3; cp = c & 0x07; min = 0x10000;
        } else {
            out.push_back(kReplacement);
            ++i;
            continue;
        }
        size_t j = i + 1;
        bool ok = true;
        for (int k = 0; k < extra; ++k, ++j) {
            if (j >= n || (s[j] & 0xC0) != 0x80) {
                ok = false;
                break;
            }
            cp = (cp << 6) | (s[j] & 0x3F);
        }
        if (!ok || cp < min || cp > 0x10FFFF || (cp >= 0xD800 && cp <= 0xDFFF)) {
            // One replacement for the broken sequence; resume at the first byte that
            // cannot continue it.
            out.push_back(kReplacement);
            i = ok ? j : std::max(j, i + 1);
            continue;
        }
        AppendUtf16(out, cp);
        i = j;
    }
    LimitLength(out);
    return out;
}

std::string WideToUtf8(std::u16string_view text)
{
    std::string out;
    out.reserve(text.size());
    size_t n = text.size();
    for (size_t i = 0; i < n; ++i) {
        char32_t c = text[i];
        if (c >= 0xD800 && c <= 0xDBFF && i + 1 < n && text[i + 1] >= 0xDC00 && text[i + 1] <= 0xDFFF) {
            c = 0x10000 + ((c - 0xD800) << 10) + (text[i + 1] - 0xDC00);
            ++i;
        } else if (c >= 0xD800 && c <= 0xDFFF) {
            c = kReplacement;
        }
        AppendUtf8(out, c);
    }
    LimitLength(out);
    return out;
}

wstring ConvertToWide(std::string_view text) { return Utf8ToWide(text); }
std::string ConvertToNarrow(std::u16string_view text) { return WideToUtf8(text); }

size_t WideLength(const wchar* text)
{
    size_t n = 0;
    while (text[n])
        ++n;
    return n;
}

unsigned StringFormat(wchar* buffer, unsigned capacity, const wchar* format, ...)
{
    if (capacity == 0)
        return 0;
    va_list args;
    va_start(args, format);
    const unsigned last = capacity - 1; // reserved for the terminator
    unsigned pos = 0;
    auto put = [&](wchar c) {
        if (pos < last)
            buffer[pos++] = c;
    };
    const wchar* p = format;
    while (*p && pos < last) {
        if (*p != u'%') {
            put(*p++);
            continue;
        }
        ++p;
        if (*p == u'%') {
            put(u'%');
            ++p;
            continue;
        }
        const wchar* spec = p - 1; // the conversion from its "%", for %f
        bool zero = false;
        unsigned width = 0;
        if (*p == u'0') {
            zero = true;
            ++p;
        }
        while (*p >= u'0' && *p <= u'9')
            width = width * 10 + (*p++ - u'0');
        if (*p == u'.') {
            ++p;
            while (*p >= u'0' && *p <= u'9')
                ++p;
        }
        if (*p == u'l')
            ++p;
        if (!*p)
            break; // the format ended inside a conversion
        wchar type = *p++;
        switch (type) {
        case u's': {
            const wchar* text = va_arg(args, const wchar*);
            if (!text)
                text = u"(null)";
            unsigned len = static_cast<unsigned>(WideLength(text));
            for (unsigned k = len; k < width; ++k)
                put(u' ');
            for (unsigned k = 0; k < len; ++k)
                put(text[k]);
            break;
        }
        case u'i':
        case u'd': {
            int value = va_arg(args, int);
            // Negative values print a minus sign before the digits.
            unsigned long long magnitude = value < 0 ? -static_cast<long long>(value) : value;
            wchar digits[24];
            unsigned count = 0;
            do {
                digits[count++] = static_cast<wchar>(u'0' + magnitude % 10);
                magnitude /= 10;
            } while (magnitude);
            if (value < 0)
                digits[count++] = u'-';
            for (unsigned k = count; k < width; ++k)
                put(zero ? u'0' : u' ');
            while (count)
                put(digits[--count]);
            break;
        }
        case u'f': {
            std::string narrow;
            for (const wchar* q = spec; q < p; ++q)
                narrow.push_back(static_cast<char>(*q));
            char out[32];
            snprintf(out, sizeof out, narrow.c_str(), va_arg(args, double));
            for (const char* q = out; *q; ++q)
                put(static_cast<wchar>(*q));
            break;
        }
        case u'u':
            OX_ASSERT(!"StringFormat: %u is not supported");
            break;
        default:
            put(type);
            break;
        }
    }
    buffer[pos] = 0;
    va_end(args);
    return pos;
}

wstring VFormatWide(const wchar* format, va_list args)
{
    wstring out;
    const wchar* p = format;
    while (*p) {
        if (*p != u'%') {
            out.push_back(*p++);
            continue;
        }
        ++p;
        if (*p == u'%') {
            out.push_back(u'%');
            ++p;
            continue;
        }
        // Collect flags, width and precision into a narrow spec for the C formatter.
        std::string spec = "%";
        bool left = false;
        while (*p == u'-' || *p == u'+' || *p == u' ' || *p == u'#' || *p == u'0') {
            if (*p == u'-')
                left = true;
            spec.push_back(static_cast<char>(*p++));
        }
        int width = -1;
        if (*p == u'*') {
            width = va_arg(args, int);
            if (width < 0) {
                left = true;
                width = -width;
                spec.push_back('-');
            }
            spec += std::to_string(width);
            ++p;
        } else if (*p >= u'0' && *p <= u'9') {
            width = 0;
            while (*p >= u'0' && *p <= u'9') {
                width = width * 10 + (*p - u'0');
                spec.push_back(static_cast<char>(*p++));
            }
        }
        int precision = -1;
        if (*p == u'.') {
            spec.push_back('.');
            ++p;
            precision = 0;
            if (*p == u'*') {
                precision = va_arg(args, int);
                spec += std::to_string(precision);
                ++p;
            } else {
                while (*p >= u'0' && *p <= u'9') {
                    precision = precision * 10 + (*p - u'0');
                    spec.push_back(static_cast<char>(*p++));
                }
            }
        }
        // Length modifiers.
        int longs = 0;
        bool shortMod = false;
        bool sizeMod = false;
        for (;;) {
            if (*p == u'l') { ++longs; ++p; }
            else if (*p == u'h') { shortMod = true; ++p; }
            else if (*p == u'z') { sizeMod = true; ++p; }
            else if (p[0] == u'I' && p[1] == u'6' && p[2] == u'4') { longs = 2; p += 3; }
            else break;
        }
        if (!*p)
            break;
        wchar type = *p++;
        auto pad = [&](const wstring& body) {
            size_t len = body.size();
            if (width > 0 && static_cast<size_t>(width) > len && !left)
                out.append(width - len, u' ');
            out += body;
            if (width > 0 && static_cast<size_t>(width) > len && left)
                out.append(width - len, u' ');
        };
        char buf[512];
        switch (type) {
        case u's':
        case u'S': {
            bool wide = (type == u's') != shortMod; // %s/%ls wide, %S/%hs narrow
            if (type == u'S' && longs)
                wide = true;
            wstring body;
            if (wide) {
                const wchar* text = va_arg(args, const wchar*);
                body = text ? wstring(text) : wstring(u"(null)");
            } else {
                const char* text = va_arg(args, const char*);
                body = ConvertToWide(text ? text : "(null)");
            }
            if (precision >= 0 && body.size() > static_cast<size_t>(precision))
                body.resize(precision);
            pad(body);
            break;
        }
        case u'c':
        case u'C': {
            wchar c = static_cast<wchar>(va_arg(args, int));
            pad(wstring(1, c));
            break;
        }
        case u'd': case u'i': case u'u': case u'x': case u'X': case u'o': {
            spec += (longs || sizeMod) ? "ll" : "";
            spec.push_back(static_cast<char>(type));
            long long value;
            if (longs >= 2)
                value = va_arg(args, long long);
            else if (longs == 1 || sizeMod)
                value = (type == u'd' || type == u'i') ? va_arg(args, long) : static_cast<long long>(va_arg(args, unsigned long));
            else
                value = (type == u'd' || type == u'i') ? va_arg(args, int) : static_cast<long long>(va_arg(args, unsigned int));
            if (!(longs || sizeMod))
                snprintf(buf, sizeof buf, spec.c_str(), static_cast<int>(value));
            else
                snprintf(buf, sizeof buf, spec.c_str(), value);
            out += ConvertToWide(buf);
            break;
        }
        case u'f': case u'F': case u'e': case u'E': case u'g': case u'G': case u'a': case u'A': {
            spec.push_back(static_cast<char>(type));
            double value = va_arg(args, double);
            int n = snprintf(buf, sizeof buf, spec.c_str(), value);
            if (n >= static_cast<int>(sizeof buf)) {
                std::vector<char> big(n + 1);
                snprintf(big.data(), big.size(), spec.c_str(), value);
                out += ConvertToWide(big.data());
            } else {
                out += ConvertToWide(buf);
            }
            break;
        }
        case u'p': {
            snprintf(buf, sizeof buf, "%p", va_arg(args, void*));
            pad(ConvertToWide(buf));
            break;
        }
        default:
            // Unknown conversion: copy it as it stands.
            out.push_back(u'%');
            out.push_back(type);
            break;
        }
    }
    return out;
}

wstring FormatWide(const wchar* format, ...)
{
    va_list args;
    va_start(args, format);
    wstring out = VFormatWide(format, args);
    va_end(args);
    return out;
}

wstring FormatString(const wchar* format, ...)
{
    constexpr size_t kCapacity = 32768;
    va_list args;
    va_start(args, format);
    wstring out = VFormatWide(format, args);
    va_end(args);
    if (out.size() >= kCapacity)
        out.resize(kCapacity - 1);
    return out;
}

std::string VFormat(const char* format, va_list args)
{
    va_list copy;
    va_copy(copy, args);
    char small[512];
    int n = vsnprintf(small, sizeof small, format, copy);
    va_end(copy);
    if (n < 0)
        return {};
    if (n < static_cast<int>(sizeof small))
        return std::string(small, n);
    std::string out(n, '\0');
    vsnprintf(out.data(), n + 1, format, args);
    return out;
}

std::string Format(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    std::string out = VFormat(format, args);
    va_end(args);
    return out;
}

} // namespace ox::misc
