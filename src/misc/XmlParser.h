#pragma once
// The program's own small XML event parser. It reads only the dialect of the game's data:
// a head that names "xml", elements, attributes in double or single quotes, comments and
// the five named references plus one-byte hexadecimal ones. Names and values are handed
// out as pointers into the caller's bytes; only a value or text that holds "&" is decoded
// into a scratch buffer, valid until the callback returns.
#include <cstddef>
#include <cstdint>
#include <string>

namespace ox::misc {

// Open elements the parser can track; a deeper element stops the parse (the file is refused).
constexpr int kXmlMaxDepth = 64;
// The head (everything up to the first ">") must be shorter than this.
constexpr size_t kXmlMaxHeadLength = 256;

// One record per open element.
struct XmlRecord {
    const char* name;       // into the data
    size_t nameLength;
    void* user;             // free for the callbacks
    void* userWord1;        // two more words free for the callbacks
    size_t userWord2;
    const char* text;       // the element's text, valid in the text callback
    size_t textLength;
};

using XmlElementStart = void (*)(void* user, XmlRecord* stack, int depth);
using XmlAttribute = void (*)(void* user, XmlRecord* stack, int depth, const char* name, size_t nameLength,
                              const char* value, size_t valueLength, bool utf8);
using XmlAttributesDone = void (*)(void* user, XmlRecord* stack, int depth);
using XmlElementEnd = void (*)(void* user, XmlRecord* stack, int depth);
using XmlText = void (*)(void* user, XmlRecord* stack, int depth, bool utf8);

// What stopped a parse early, or was skipped, for the caller's log line. The parse of a
// broken body otherwise goes on or stops silently, keeping what the callbacks made.
struct XmlParseProblem {
    std::string what;   // empty when nothing was noticed
    unsigned line = 0;  // 1-based line of the problem
};

// Parses `size` bytes at `data`. Any callback may be null. The result is true if the head
// was accepted (it is false for a missing or bad head, a null data pointer and for nesting
// deeper than kXmlMaxDepth).
bool ParseXml(const char* data, size_t size, void* user, XmlElementStart onStart, XmlAttribute onAttribute,
              XmlAttributesDone onAttributesDone, XmlElementEnd onEnd, XmlText onText,
              XmlParseProblem* problem = nullptr);

// The 1-based line of `where`, a pointer into the parsed `data` (a name in a record), for log lines.
unsigned XmlLineOf(const char* data, const char* where);

// Decodes the references in `text` as the parser does (appends to `out`).
void XmlDecode(const char* text, size_t length, bool utf8, std::string& out);

} // namespace ox::misc
