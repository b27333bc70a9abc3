#pragma once
// An XML file read with the engine's own parser into a flat list of elements, each with its
// line, so that the checks can name where a mistake is.
#include <string>
#include <utility>
#include <vector>

namespace oxlint {

struct XmlElement {
    std::string name;
    unsigned line = 0;
    int depth = 0;      // 0 for the root element
    int parent = -1;    // index of the enclosing element, -1 for the root
    std::vector<std::pair<std::string, std::string>> attributes;

    // The attribute's value, or empty.
    const std::string& Attr(const std::string& attribute) const;
    bool Has(const std::string& attribute) const;
};

struct XmlDoc {
    std::string path;      // relative to the game folder, as messages show it
    std::vector<XmlElement> elements;
    std::string problem;   // what the parser noticed; empty when the file parsed
    unsigned problemLine = 0;

    // The root element's name, or empty.
    const std::string& RootName() const;
};

// Reads and parses `file`; `shown` is the path messages use. False when the file cannot be read.
bool ReadXmlDoc(const std::string& file, const std::string& shown, XmlDoc& doc);
// Parses bytes held in memory.
void ParseXmlDoc(const std::string& bytes, XmlDoc& doc);

} // namespace oxlint
