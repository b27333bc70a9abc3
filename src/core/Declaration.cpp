#include "core/Declaration.h"

#include "core/Settings.h"
#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/GamePack.h"
#include "misc/Unicode.h"
#include "misc/XmlParser.h"

#include <strings.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <set>

namespace ox::core {

namespace {

// Interns `value` into `id`; false, leaving `id` as it was, when no identifier holds it.
bool TakeId(InternedId& id, std::string_view value)
{
    if (value.size() > kMaxIdLength)
        return false;
    id = InternId(value);
    return true;
}

} // namespace

InternedId FindDeclarationId(const char* id) { return FindId(id ? std::string_view(id) : std::string_view()); }

Declaration::Declaration() : m_Id(&EmptyId()) {}

bool Declaration::SetAttribute(const char* name, const std::string& value)
{
    return strcasecmp(name, "id") != 0 || TakeId(m_Id, value);
}

FontDeclaration::FontDeclaration() : image(&EmptyId()) {}

bool FontDeclaration::SetAttribute(const char* name, const std::string& value)
{
    if (strcasecmp(name, "image") == 0)
        return TakeId(image, value);
    if (strcasecmp(name, "file") == 0)
        file = value;
    else if (strcasecmp(name, "color") == 0)
        color = graphics::Color(static_cast<uint32_t>(strtoul(value.c_str(), nullptr, 10)));
    else
        return Declaration::SetAttribute(name, value);
    return true;
}

ResourceGroup::ResourceGroup() : m_Id(&EmptyId()) {}

ResourceGroup* ResourceGroup::FindGroup(const char* id) const
{
    InternedId wanted = FindDeclarationId(id);
    for (const auto& group : m_Groups)
        if (group->m_Id == wanted)
            return group.get();
    return nullptr;
}

namespace {

// What the parser's stack entries hold: a group or a declaration, never both. A mistake in
// the file is logged with the file's name and line, and the entry is skipped with its content.
struct LoadContext {
    ResourceGroup* target = nullptr;
    const char* name = "";
    const char* data = nullptr;
    bool isGroup = true;
    std::set<InternedId> seen;

    unsigned LineOf(const misc::XmlRecord& record) const { return misc::XmlLineOf(data, record.name); }
};

// The kind of an entry, in the record's second user word. An entry that turned out bad
// keeps its object until its end, which removes it; its content is skipped silently.
enum : size_t { EntryNone = 0, EntryGroup = 1, EntryDeclaration = 2, EntryBad = 4 };

bool NameIs(const misc::XmlRecord& record, const char* name)
{
    size_t n = strlen(name);
    return record.nameLength == n && strncasecmp(record.name, name, n) == 0;
}

std::string ElementName(const misc::XmlRecord& record) { return std::string(record.name, record.nameLength); }

void OnStart(void* user, misc::XmlRecord* stack, int depth)
{
    auto* context = static_cast<LoadContext*>(user);
    misc::XmlRecord& record = stack[depth];
    record.user = nullptr;
    record.userWord2 = EntryNone;
    if (depth == 0) {
        record.user = context->target;
        record.userWord2 = EntryGroup;
        context->isGroup = true;
        return;
    }
    const misc::XmlRecord& parentRecord = stack[depth - 1];
    if (parentRecord.userWord2 == EntryDeclaration) {
        OX_LOG("resdecl", diag::LogError, "%s line %u: element \"%s\" inside font \"%s\" skipped", context->name,
               context->LineOf(record), ElementName(record).c_str(),
               static_cast<const Declaration*>(parentRecord.user)->m_Id->c_str());
        return;
    }
    if (parentRecord.userWord2 != EntryGroup)
        return; // inside a skipped entry
    auto* parent_group = static_cast<ResourceGroup*>(parentRecord.user);
    if (NameIs(record, "group")) {
        parent_group->m_Groups.push_back(std::make_unique<ResourceGroup>());
        record.user = parent_group->m_Groups.back().get();
        record.userWord2 = EntryGroup;
        context->isGroup = true;
    } else if (NameIs(record, "font")) {
        parent_group->m_Declarations.emplace_back();
        FontDeclaration& declaration = parent_group->m_Declarations.back();
        declaration.m_Group = parent_group;
        record.user = &declaration;
        record.userWord2 = EntryDeclaration;
        context->isGroup = false;
    } else {
        OX_LOG("resdecl", diag::LogError, "%s line %u: unknown element \"%s\" skipped with its content",
               context->name, context->LineOf(record), ElementName(record).c_str());
    }
}

void OnAttribute(void* user, misc::XmlRecord* stack, int depth, const char* name, size_t nameLength,
                 const char* value, size_t valueLength, bool /*utf8*/)
{
    auto* context = static_cast<LoadContext*>(user);
    misc::XmlRecord& record = stack[depth];
    if (!record.user || (record.userWord2 & EntryBad))
        return;
    std::string attribute(name, nameLength);
    std::string text(value, valueLength);
    bool taken = true;
    if (record.userWord2 == EntryGroup) {
        auto* group = static_cast<ResourceGroup*>(record.user);
        if (strcasecmp(attribute.c_str(), "id") == 0)
            taken = TakeId(group->m_Id, text);
        else if (strcasecmp(attribute.c_str(), "flags") == 0)
            group->m_Flags = 0; // accepted; groups carry no flags
    } else {
        taken = static_cast<Declaration*>(record.user)->SetAttribute(attribute.c_str(), text);
    }
    if (taken)
        return;
    // The root is the caller's group: it stays, without the id.
    const char* skipped = depth == 0 ? "the id" : record.userWord2 == EntryGroup ? "group" : "font";
    OX_LOG("resdecl", diag::LogError, "%s line %u: %s skipped: its %s \"%.*s\" is longer than %zu characters",
           context->name, context->LineOf(record), skipped, attribute.c_str(),
           static_cast<int>(std::min<size_t>(text.size(), 120)), text.c_str(), kMaxIdLength);
    if (depth > 0)
        record.userWord2 |= EntryBad;
}

// An entry ends last among its siblings: removing it is taking the last one away.
void RemoveLastGroup(ResourceGroup& parent, const ResourceGroup* group)
{
    if (!parent.m_Groups.empty() && parent.m_Groups.back().get() == group)
        parent.m_Groups.pop_back();
}

void RemoveLastDeclaration(const FontDeclaration* declaration)
{
    ResourceGroup* group = declaration->m_Group;
    if (group && !group->m_Declarations.empty() && &group->m_Declarations.back() == declaration)
        group->m_Declarations.pop_back();
}

void OnEnd(void* user, misc::XmlRecord* stack, int depth)
{
    auto* context = static_cast<LoadContext*>(user);
    misc::XmlRecord& record = stack[depth];
    if (record.userWord2 == (EntryGroup | EntryBad)) {
        RemoveLastGroup(*static_cast<ResourceGroup*>(stack[depth - 1].user), static_cast<ResourceGroup*>(record.user));
        return;
    }
    if (!(record.userWord2 & EntryDeclaration))
        return;
    auto* declaration = static_cast<FontDeclaration*>(record.user);
    if (record.userWord2 & EntryBad) {
        RemoveLastDeclaration(declaration);
        return;
    }
    declaration->OnEnd();
    if (context->seen.insert(declaration->m_Id).second)
        return;
    // The first declaration of an id wins; this one is the last of its group.
    OX_LOG("resdecl", diag::LogWarning, u"Resource declaration \"%ls\" already loaded.",
           misc::ConvertToWide(declaration->m_Id->view()).c_str());
    record.user = nullptr;
    record.userWord2 = EntryNone;
    RemoveLastDeclaration(declaration);
}

} // namespace

void CResourceDeclarations::LoadFromMemory(const char* data, size_t size, const char* name, const char* group)
{
    ResourceGroup* target = this;
    if (group) {
        if (strlen(group) > kMaxIdLength) {
            OX_LOG("resdecl", diag::LogError, "%s: the group name \"%s\" is longer than %zu characters", name, group,
                   kMaxIdLength);
            return;
        }
        target = FindGroup(group);
        if (!target) {
            m_Groups.push_back(std::make_unique<ResourceGroup>());
            target = m_Groups.back().get();
            target->m_Id = InternId(group);
        }
    }
    LoadContext context;
    context.target = target;
    context.name = name;
    context.data = data;
    misc::XmlParseProblem problem;
    if (!misc::ParseXml(data, size, &context, OnStart, OnAttribute, nullptr, OnEnd, nullptr, &problem) ||
        !problem.what.empty())
        OX_LOG("resdecl", diag::LogError, "%s line %u: %s", name, problem.line,
               problem.what.empty() ? "not an XML file" : problem.what.c_str());
}

void CResourceDeclarations::Load(const char* path, const char* group)
{
    misc::CGamePack& pack = misc::g_GamePack::Instance();
    unsigned size = 0;
    const char* data = static_cast<const char*>(pack.Open(path, &size));
    if (!data)
        return;
    LoadFromMemory(data, size, path, group);
    pack.Close(data);
}

} // namespace ox::core
