#include "misc/XmlWriter.h"

#include "misc/sys/Path.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/Unicode.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>

#include <fcntl.h>
#include <unistd.h>

namespace ox::misc {

// ---------------------------------------------------------------------------------------
// CXmlWriter

CXmlWriter::CXmlWriter(bool header)
{
    m_Chunks.reserve(16);
    if (header)
        Write("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n");
}

CXmlWriter::~CXmlWriter() = default;

void CXmlWriter::Write(const char* value, int length)
{
    const char* _value = value;
    OX_ASSERT(_value);
    if (!value)
        return;
    size_t left = length < 0 ? strlen(value) : static_cast<size_t>(length);
    while (left > 0) {
        // A new chunk only when bytes remain: a full last chunk is never followed by an empty one.
        if (m_Chunks.empty() || m_CurrentChunkSize == ChunkSize) {
            m_Chunks.emplace_back(new char[ChunkSize]);
            m_CurrentChunkSize = 0;
        }
        int free_space = ChunkSize - m_CurrentChunkSize;
        OX_ASSERT(free_space >= 0);
        size_t n = left < static_cast<size_t>(free_space) ? left : static_cast<size_t>(free_space);
        memcpy(m_Chunks.back().get() + m_CurrentChunkSize, value, n);
        m_CurrentChunkSize += static_cast<int>(n);
        OX_ASSERT(m_CurrentChunkSize <= ChunkSize);
        value += n;
        left -= n;
    }
}

void CXmlWriter::Write(const wchar* text)
{
    OX_ASSERT(text);
    if (!text)
        return;
    std::string escaped = EscapeXml(wstring(text));
    Write(escaped.data(), static_cast<int>(escaped.size()));
}

size_t CXmlWriter::GetSize() const
{
    if (m_Chunks.empty())
        return 0;
    return (m_Chunks.size() - 1) * static_cast<size_t>(ChunkSize) + static_cast<size_t>(m_CurrentChunkSize);
}

bool CXmlWriter::GetBuffer(void** data, unsigned* size) const
{
    if (m_Chunks.empty())
        return false;
    size_t total = GetSize();
    char* block = static_cast<char*>(malloc(total));
    if (!block)
        throw std::bad_alloc();
    for (size_t i = 0; i < m_Chunks.size(); ++i) {
        size_t bytes = i + 1 < m_Chunks.size() ? ChunkSize : static_cast<size_t>(m_CurrentChunkSize);
        memcpy(block + i * ChunkSize, m_Chunks[i].get(), bytes);
    }
    *data = block;
    *size = static_cast<unsigned>(total);
    return true;
}

void CXmlWriter::SaveToFile(const wstring& path) const
{
    if (m_Chunks.empty())
        return;
    sys::AtomicWrite result = sys::WriteFileAtomically(WideToUtf8(path), [this](FILE* file) {
        for (size_t i = 0; i < m_Chunks.size(); ++i) {
            size_t bytes = i + 1 < m_Chunks.size() ? ChunkSize : static_cast<size_t>(m_CurrentChunkSize);
            size_t written = fwrite(m_Chunks[i].get(), bytes, 1, file);
            OX_ASSERT_A(written==1);
            if (written != 1)
                return false;
        }
        return true;
    });
    if (result == sys::AtomicWrite::CannotCreate)
        OX_LOG("xmlwriter", diag::LogError, u"Cannot open file to save (\"%ls\")", path.c_str());
    else if (result == sys::AtomicWrite::CannotWrite)
        OX_LOG("xmlwriter", diag::LogError, u"Cannot write file to save (\"%ls\")", path.c_str());
    else if (result == sys::AtomicWrite::CannotReplace)
        OX_LOG("xmlwriter", diag::LogError, u"Cannot replace file to save (\"%ls\")", path.c_str());
}

// ---------------------------------------------------------------------------------------
// CXmlElement

CXmlElement::CXmlElement(CXmlWriter& writer, const char* name) : m_Name(name), m_Writer(&writer) { Open(); }

CXmlElement::CXmlElement(CXmlElement& parent, const char* name) : m_Name(name), m_Writer(parent.m_Writer)
{
    if (!parent.m_HasChildren) {
        m_Writer->Write(">\n", 2);
        parent.m_HasChildren = true;
    }
    Open();
}

CXmlElement::~CXmlElement() { Flush(); }

void CXmlElement::Open()
{
    OX_ASSERT(m_Name);
    m_Writer->Write("<", 1);
    m_Writer->Write(m_Name ? m_Name : "");
    m_Writer->Write(" ", 1);
}

void CXmlElement::Attr(const char* name, const char* value)
{
    m_Writer->Write(name);
    m_Writer->Write("=\"", 2);
    m_Writer->Write(value);
    m_Writer->Write("\" ", 2);
}

void CXmlElement::Attr(const char* name, const wstring& value)
{
    std::string escaped = EscapeXml(value);
    m_Writer->Write(name);
    m_Writer->Write("=\"", 2);
    m_Writer->Write(escaped.data(), static_cast<int>(escaped.size()));
    m_Writer->Write("\" ", 2);
}

void CXmlElement::Flush()
{
    if (m_Closed)
        return;
    m_Closed = true;
    if (m_HasChildren) {
        m_Writer->Write("</", 2);
        m_Writer->Write(m_Name ? m_Name : "");
        m_Writer->Write(">\n", 2);
    } else {
        m_Writer->Write("/>\n", 3);
    }
}

// ---------------------------------------------------------------------------------------
// Escape and formatters

std::string EscapeXml(const std::string& text)
{
    std::string out;
    out.reserve(text.size());
    for (unsigned char c : text) {
        switch (c) {
        case '&': out += "&amp;"; break;
        case '<': out += "&lt;"; break;
        case '>': out += "&gt;"; break;
        case '"': out += "&quot;"; break;
        case '\'': out += "&apos;"; break;
        default:
            if (c < 0x20) {
                static const char kHex[] = "0123456789ABCDEF";
                out += "&#x";
                out += kHex[c >> 4];
                out += kHex[c & 15];
                out += ';';
            } else {
                out += static_cast<char>(c);
            }
        }
    }
    return out;
}

std::string EscapeXml(const wstring& text) { return EscapeXml(WideToUtf8(text)); }

std::string EscapeXml(const char* text) { return EscapeXml(ConvertToWide(text ? text : "")); }

namespace {

// Room for eight floats of any magnitude with three decimals.
char g_ValueBuffer[512];

int Decimals(float value)
{
    float d = (value - std::trunc(value)) * 1000.0f;
    return d != 0.0f ? 3 : 0;
}

const char* FormatFloats(const float* values, size_t count)
{
    size_t used = 0;
    g_ValueBuffer[0] = 0;
    for (size_t i = 0; i < count && used < sizeof g_ValueBuffer; ++i) {
        int n = snprintf(g_ValueBuffer + used, sizeof g_ValueBuffer - used, i ? " %.*f" : "%.*f", Decimals(values[i]),
                         static_cast<double>(values[i]));
        if (n < 0)
            break;
        used += static_cast<size_t>(n);
    }
    return g_ValueBuffer;
}

} // namespace

const char* ToXmlValue(float value) { return FormatFloats(&value, 1); }

const char* ToXmlValue(int value)
{
    snprintf(g_ValueBuffer, sizeof g_ValueBuffer, "%d", value);
    return g_ValueBuffer;
}

const char* ToXmlValue(unsigned value)
{
    snprintf(g_ValueBuffer, sizeof g_ValueBuffer, "%d", static_cast<int>(value));
    return g_ValueBuffer;
}

const char* ToXmlValue(bool value) { return value ? "true" : "false"; }

const char* ToXmlValue(const Vector<float>& value)
{
    const float values[] = {value.X, value.Y};
    return FormatFloats(values, 2);
}

const char* ToXmlValue(const Vector<int>& value)
{
    snprintf(g_ValueBuffer, sizeof g_ValueBuffer, "%i %i", value.X, value.Y);
    return g_ValueBuffer;
}

const char* ToXmlValue(int16_t first, int16_t second)
{
    snprintf(g_ValueBuffer, sizeof g_ValueBuffer, "%i %i", first, second);
    return g_ValueBuffer;
}

const char* ToXmlValue(const Rect<float>& value)
{
    const float values[] = {value.X, value.Y, value.Width, value.Height};
    return FormatFloats(values, 4);
}

const char* ToXmlValue(const Vector<float> (&points)[4])
{
    const float values[] = {points[0].X, points[0].Y, points[1].X, points[1].Y,
                            points[2].X, points[2].Y, points[3].X, points[3].Y};
    return FormatFloats(values, 8);
}

const char* ToXmlValue(const graphics::Color& value)
{
    snprintf(g_ValueBuffer, sizeof g_ValueBuffer, "%d", static_cast<int>(value.GetARGB()));
    return g_ValueBuffer;
}

} // namespace ox::misc
