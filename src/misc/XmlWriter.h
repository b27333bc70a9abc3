#pragma once
// One-pass XML writing: the writer collects the text in memory in large chunks and saves it
// in one go; an element writes its tags as it is opened, given attributes, given children and
// closed, so nested scopes produce the document with no tree in between. Main thread only.
#include "graphics/Color.h"
#include "misc/Rect.h"
#include "misc/Vector.h"
#include "misc/WideChar.h"
#include "misc/ptr.h"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace ox::misc {

class CXmlWriter : public CRefCountedObj {
public:
    static constexpr int ChunkSize = 0x40000;

    // With `header`, the text starts with the XML declaration (UTF-8) and a line end.
    explicit CXmlWriter(bool header);
    ~CXmlWriter() override;
    CXmlWriter(const CXmlWriter&) = delete;
    CXmlWriter& operator=(const CXmlWriter&) = delete;

    // Appends raw bytes; a negative length means up to the terminator.
    void Write(const char* value, int length = -1);
    // Appends the text as UTF-8, escaped.
    void Write(const wchar* text);

    // Writes the text to a temporary file next to `path`, flushes it to disk and renames it
    // over `path`, so that a failure never leaves a half-written file. Nothing is written
    // when the writer holds no text. Failures are logged on channel "xmlwriter".
    // The text stays in the writer: it can be saved again.
    void SaveToFile(const wstring& path) const;

    // A copy of the whole text in one block allocated with malloc (the caller frees it).
    // False when the writer holds no text.
    bool GetBuffer(void** data, unsigned* size) const;

    size_t GetSize() const;
    size_t GetChunkCount() const { return m_Chunks.size(); }

private:
    std::vector<std::unique_ptr<char[]>> m_Chunks;
    int m_CurrentChunkSize = 0; // bytes used in the last chunk
};

// An element: "<name " at construction, `name="value" ` per attribute, and at Flush (or
// destruction) "/>" or, after children, "</name>". Attributes must come before children.
// `name` must outlive the element.
class CXmlElement {
public:
    CXmlElement(CXmlWriter& writer, const char* name);
    // A child: the parent's start tag is ended first if this is its first child.
    CXmlElement(CXmlElement& parent, const char* name);
    ~CXmlElement();
    CXmlElement(const CXmlElement&) = delete;
    CXmlElement& operator=(const CXmlElement&) = delete;

    // The value goes out unchanged, with no escape.
    void Attr(const char* name, const char* value);
    // The value goes out as UTF-8, escaped.
    void Attr(const char* name, const wstring& value);
    // Closes the element; later calls do nothing.
    void Flush();

private:
    void Open();

    const char* m_Name;
    bool m_HasChildren = false;
    bool m_Closed = false;
    CXmlWriter* m_Writer;
};

// The escape of attribute values: & < > " ' as references, bytes below 0x20 as "&#xHH;",
// everything else (bytes from 0x80 up too) as it is.
std::string EscapeXml(const std::string& text);
std::string EscapeXml(const wstring& text);
// Narrow text is converted to wide text first (invalid UTF-8 becomes U+FFFD).
std::string EscapeXml(const char* text);

// Value formatters. Each returns a pointer into one static buffer, valid until the next call.
// A float has 3 decimals if its fraction times 1000 (as a float) is not 0, else none.
const char* ToXmlValue(float value);
const char* ToXmlValue(int value);
const char* ToXmlValue(unsigned value);
const char* ToXmlValue(bool value);
const char* ToXmlValue(const Vector<float>& value);
const char* ToXmlValue(const Vector<int>& value);
const char* ToXmlValue(int16_t first, int16_t second);
const char* ToXmlValue(const Rect<float>& value);
// Four points: top left, top right, bottom right, bottom left.
const char* ToXmlValue(const Vector<float> (&points)[4]);
// The packed 0xAARRGGBB value as a signed decimal.
const char* ToXmlValue(const graphics::Color& value);

} // namespace ox::misc
