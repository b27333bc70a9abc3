#include "misc/XmlParser.h"

#include "diag/Assert.h"

#include <algorithm>
#include <cstring>
#include <string_view>

namespace ox::misc {

namespace {

// Names are ASCII letters, digits and "_"; a byte from 0x80 up is not a name character.
inline bool IsNameChar(unsigned char c)
{
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_';
}

// Bytes of the character that starts with `lead`: whole characters in a UTF-8 file, bytes otherwise.
inline size_t CharLength(unsigned char lead, bool utf8)
{
    if (!utf8 || lead < 0xC2)
        return 1;
    if (lead <= 0xDF)
        return 2;
    if (lead <= 0xEF)
        return 3;
    if (lead <= 0xF4)
        return 4;
    return 1;
}

inline int HexDigit(char c)
{
    if (c >= '0' && c <= '9')
        return c - '0';
    if (c >= 'A' && c <= 'F')
        return c - 'A' + 10;
    return -1;
}

const char* FindByte(const char* from, const char* end, char c)
{
    return from < end ? static_cast<const char*>(memchr(from, c, static_cast<size_t>(end - from))) : nullptr;
}

const char* FindText(const char* from, const char* end, std::string_view what)
{
    const char* found = std::search(from, end, what.begin(), what.end());
    return found == end ? nullptr : found;
}

struct Reporter {
    const char* data;
    XmlParseProblem* problem;

    void Note(const char* what, const char* where) const
    {
        if (!problem || !problem->what.empty())
            return;
        problem->what = what;
        problem->line = XmlLineOf(data, where);
    }
};

} // namespace

unsigned XmlLineOf(const char* data, const char* where)
{
    return 1 + static_cast<unsigned>(std::count(data, where, '\n'));
}

void XmlDecode(const char* text, size_t length, bool utf8, std::string& out)
{
    static const struct {
        std::string_view ref;
        char value;
    } kNamed[] = {{"&lt;", '<'}, {"&gt;", '>'}, {"&amp;", '&'}, {"&quot;", '"'}, {"&apos;", '\''}};

    const char* p = text;
    const char* end = text + length;
    while (p < end) {
        size_t left = static_cast<size_t>(end - p);
        if (*p != '&') {
            size_t n = std::min(CharLength(static_cast<unsigned char>(*p), utf8), left);
            out.append(p, n);
            p += n;
            continue;
        }
        bool named = false;
        for (const auto& entry : kNamed) {
            if (left >= entry.ref.size() && memcmp(p, entry.ref.data(), entry.ref.size()) == 0) {
                out += entry.value;
                p += entry.ref.size();
                named = true;
                break;
            }
        }
        if (named)
            continue;
        // "&#xH;" or "&#xHH;": one byte. The three characters before the digits are not checked.
        p += std::min<size_t>(3, left);
        unsigned value = 0;
        for (int digits = 0; digits < 2 && p < end && HexDigit(*p) >= 0; ++digits, ++p)
            value = value * 16 + static_cast<unsigned>(HexDigit(*p));
        if (p < end && *p == ';')
            ++p;
        out += static_cast<char>(value);
    }
}

bool ParseXml(const char* data, size_t size, void* user, XmlElementStart onStart, XmlAttribute onAttribute,
              XmlAttributesDone onAttributesDone, XmlElementEnd onEnd, XmlText onText, XmlParseProblem* problem)
{
    if (problem)
        *problem = XmlParseProblem{};
    const char* _data = data;
    OX_ASSERT(_data);
    if (!data)
        return false;
    const Reporter report{data, problem};
    const char* end = data + size;

    // The head: everything up to the first ">".
    const char* headEnd = FindByte(data, end, '>');
    if (!headEnd) {
        report.Note("no \">\" in the data", end);
        return false;
    }
    std::string_view head(data, static_cast<size_t>(headEnd - data) + 1);
    if (head.size() >= kXmlMaxHeadLength) {
        report.Note("the head is 256 bytes or longer", data);
        return false;
    }
    if (head.find("xml") == std::string_view::npos) {
        report.Note("the head does not name \"xml\"", data);
        return false;
    }
    const bool utf8 = head.find("utf-8") != std::string_view::npos || head.find("UTF-8") != std::string_view::npos;

    XmlRecord stack[kXmlMaxDepth] = {};
    int depth = 0;
    std::string scratch;
    auto decode = [&](const char* text, size_t length) {
        if (scratch.capacity() < 128)
            scratch.reserve(128);
        scratch.clear();
        XmlDecode(text, length, utf8, scratch);
    };

    const char* p = headEnd + 1;
    for (;;) {
        const char* tag = FindByte(p, end, '<');
        if (!tag)
            break;
        p = tag + 1;
        if (p == end) {
            report.Note("the data ends inside a tag", tag);
            break;
        }

        if (*p == '/') {
            ++p;
            if (depth == 0) {
                // Nothing is open (the close of a "<xml>" head, or a stray tag): skip it.
                const char* close = FindByte(p, end, '>');
                if (!close) {
                    report.Note("the data ends inside a closing tag", tag);
                    break;
                }
                p = close + 1;
                continue;
            }
            --depth;
            XmlRecord& record = stack[depth];
            if (p < end && *p == '>') { // "</>": an anonymous close, no callbacks
                ++p;
                continue;
            }
            if (record.text && onText) {
                record.textLength = static_cast<size_t>(tag - record.text);
                if (memchr(record.text, '&', record.textLength)) {
                    decode(record.text, record.textLength);
                    record.text = scratch.c_str();
                    record.textLength = scratch.size();
                }
                onText(user, stack, depth, utf8);
            }
            if (onEnd)
                onEnd(user, stack, depth);
            const char* close = FindByte(p, end, '>');
            if (!close) {
                report.Note("the data ends inside a closing tag", tag);
                break;
            }
            p = close + 1;
            continue;
        }

        // An element with child elements (or a comment) has no text.
        if (depth > 0)
            stack[depth - 1].text = nullptr;
        if (end - p >= 3 && memcmp(p, "!--", 3) == 0) {
            const char* close = FindText(p + 3, end, "-->");
            if (!close) {
                report.Note("a comment is not closed", tag);
                break;
            }
            p = close + 3;
            continue;
        }

        while (p < end && !IsNameChar(static_cast<unsigned char>(*p)))
            ++p;
        if (p == end) {
            report.Note("the data ends inside a tag", tag);
            break;
        }
        if (depth >= kXmlMaxDepth) {
            report.Note("elements are nested deeper than 64", tag);
            return false;
        }
        XmlRecord& record = stack[depth];
        record = XmlRecord{};
        record.name = p;
        while (p < end && IsNameChar(static_cast<unsigned char>(*p)))
            ++p;
        record.nameLength = static_cast<size_t>(p - record.name);
        if (onStart)
            onStart(user, stack, depth);

        bool stopped = false;
        for (;;) {
            while (p < end && !IsNameChar(static_cast<unsigned char>(*p)) && *p != '/' && *p != '>')
                ++p;
            if (p == end) {
                report.Note("the data ends inside a tag", tag);
                stopped = true;
                break;
            }
            if (*p == '/' || *p == '>')
                break;
            const char* name = p;
            while (p < end && IsNameChar(static_cast<unsigned char>(*p)))
                ++p;
            size_t nameLength = static_cast<size_t>(p - name);
            while (p < end && *p != '"' && *p != '\'')
                ++p;
            if (p == end) {
                report.Note("an attribute has no quoted value", name);
                stopped = true;
                break;
            }
            const char quote = *p++;
            const char* value = p;
            while (p < end && *p != quote) {
                size_t step = CharLength(static_cast<unsigned char>(*p), utf8);
                if (step > static_cast<size_t>(end - p)) {
                    p = end;
                    break;
                }
                p += step;
            }
            if (p >= end) {
                report.Note("an attribute value is not closed", name);
                stopped = true;
                break;
            }
            size_t valueLength = static_cast<size_t>(p - value);
            ++p;
            if (!onAttribute)
                continue;
            if (memchr(value, '&', valueLength)) {
                decode(value, valueLength);
                onAttribute(user, stack, depth, name, nameLength, scratch.data(), scratch.size(), utf8);
            } else {
                onAttribute(user, stack, depth, name, nameLength, value, valueLength, utf8);
            }
        }
        if (stopped)
            break;

        if (onAttributesDone)
            onAttributesDone(user, stack, depth);
        if (*p == '/') {
            if (p + 1 < end && p[1] == '>') {
                if (onEnd)
                    onEnd(user, stack, depth);
                p += 2;
                continue;
            }
            report.Note("\"/\" is not followed by \">\"", p);
            break;
        }
        ++p; // ">"
        stack[depth].text = p;
        stack[depth].textLength = 0;
        ++depth;
        if (depth < kXmlMaxDepth)
            stack[depth].text = nullptr;
    }
    if (depth > 0)
        report.Note("elements are not closed at the end of the data", stack[depth - 1].name);
    return true;
}

} // namespace ox::misc
