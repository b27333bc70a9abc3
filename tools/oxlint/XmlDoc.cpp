#include "oxlint/XmlDoc.h"

#include "misc/XmlParser.h"
#include "misc/sys/Path.h"

namespace oxlint {

namespace {

struct Builder {
    const char* data;
    XmlDoc* doc;
    std::vector<int> open;
};

void OnStart(void* user, ox::misc::XmlRecord* stack, int depth)
{
    auto* b = static_cast<Builder*>(user);
    XmlElement element;
    element.name.assign(stack[depth].name, stack[depth].nameLength);
    element.line = ox::misc::XmlLineOf(b->data, stack[depth].name);
    element.depth = depth;
    element.parent = b->open.empty() ? -1 : b->open.back();
    b->open.push_back(static_cast<int>(b->doc->elements.size()));
    b->doc->elements.push_back(std::move(element));
}

void OnAttribute(void* user, ox::misc::XmlRecord*, int, const char* name, size_t nameLength, const char* value,
                 size_t valueLength, bool)
{
    auto* b = static_cast<Builder*>(user);
    b->doc->elements.back().attributes.emplace_back(std::string(name, nameLength), std::string(value, valueLength));
}

void OnEnd(void* user, ox::misc::XmlRecord*, int)
{
    auto* b = static_cast<Builder*>(user);
    if (!b->open.empty())
        b->open.pop_back();
}

} // namespace

const std::string& XmlElement::Attr(const std::string& attribute) const
{
    static const std::string empty;
    for (const auto& [name, value] : attributes)
        if (name == attribute)
            return value;
    return empty;
}

bool XmlElement::Has(const std::string& attribute) const
{
    for (const auto& entry : attributes)
        if (entry.first == attribute)
            return true;
    return false;
}

const std::string& XmlDoc::RootName() const
{
    static const std::string empty;
    return elements.empty() ? empty : elements.front().name;
}

void ParseXmlDoc(const std::string& bytes, XmlDoc& doc)
{
    Builder builder{bytes.data(), &doc, {}};
    ox::misc::XmlParseProblem problem;
    const bool headOk = ox::misc::ParseXml(bytes.data(), bytes.size(), &builder, OnStart, OnAttribute, nullptr, OnEnd,
                                           nullptr, &problem);
    if (!problem.what.empty()) {
        doc.problem = problem.what;
        doc.problemLine = problem.line;
    } else if (!headOk) {
        doc.problem = "the file is not XML the game reads";
        doc.problemLine = 1;
    } else if (doc.elements.empty()) {
        doc.problem = "the file holds no element";
        doc.problemLine = 1;
    }
}

bool ReadXmlDoc(const std::string& file, const std::string& shown, XmlDoc& doc)
{
    doc.path = shown;
    std::string bytes;
    if (!ox::misc::sys::ReadWholeFile(file, bytes))
        return false;
    ParseXmlDoc(bytes, doc);
    return true;
}

} // namespace oxlint
