#include "core/Declaration.h"

#include "core/Settings.h"
#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/GamePack.h"
#include "misc/Unicode.h"
#include "misc/XmlParser.h"

#include <strings.h>

#include <cstdlib>
#include <cstring>
#include <set>

namespace ox::core {

InternedId InternDeclarationId(const char* id) { return InternId(id ? std::string_view(id) : std::string_view()); }

Declaration::Declaration() : m_Id(InternId({})) {}

void Declaration::SetAttribute(const char* name, const std::string& value)
{
    if (strcasecmp(name, "id") == 0)
        m_Id = InternId(value);
}

FontDeclaration::FontDeclaration() : image(InternId({})) {}

void FontDeclaration::SetAttribute(const char* name, const std::string& value)
{
    if (strcasecmp(name, "image") == 0)
        image = InternId(value);
    else if (strcasecmp(name, "file") == 0)
        file = value;
    else if (strcasecmp(name, "color") == 0)
        color = graphics::Color(static_cast<uint32_t>(strtoul(value.c_str(), nullptr, 10)));
    else
        Declaration::SetAttribute(name, value);
}

ResourceGroup::ResourceGroup() : m_Id(InternId({})) {}

ResourceGroup* ResourceGroup::FindGroup(const char* id) const
{
    InternedId wanted = InternDeclarationId(id);
    for (const auto& group : m_Groups)
        if (group->m_Id == wanted)
            return group.get();
    return nullptr;
}

namespace {

// What the parser's stack entries hold: a group or a declaration, never both.
struct LoadContext {
    ResourceGroup* target = nullptr;
    const char* name = "";
    bool isGroup = true;
    std::set<InternedId> seen;
};

enum : size_t { EntryNone = 0, EntryGroup = 1, EntryDeclaration = 2 };

bool NameIs(const misc::XmlRecord& record, const char* name)
{
    size_t n = strlen(name);
    return record.nameLength == n && strncasecmp(record.name, name, n) == 0;
}

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
    misc::XmlRecord& parentRecord = stack[depth - 1];
    auto* parent_group = parentRecord.userWord2 == EntryGroup ? static_cast<ResourceGroup*>(parentRecord.user) : nullptr;
    OX_ASSERT(parent_group);
    if (!parent_group)
        return;
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
        std::string element(record.name, record.nameLength);
        OX_LOG("resdecl", diag::LogError, "%s: unknown element \"%s\"", context->name, element.c_str());
        OX_ASSERT(!"unknown resource declaration element");
    }
}

void OnAttribute(void* user, misc::XmlRecord* stack, int depth, const char* name, size_t nameLength,
                 const char* value, size_t valueLength, bool /*utf8*/)
{
    (void)user;
    misc::XmlRecord& record = stack[depth];
    if (!record.user)
        return;
    std::string attribute(name, nameLength);
    std::string text(value, valueLength);
    if (record.userWord2 == EntryGroup) {
        auto* group = static_cast<ResourceGroup*>(record.user);
        if (strcasecmp(attribute.c_str(), "id") == 0)
            group->m_Id = InternId(text);
        else if (strcasecmp(attribute.c_str(), "flags") == 0)
            group->m_Flags = 0; // accepted; groups carry no flags
    } else {
        static_cast<Declaration*>(record.user)->SetAttribute(attribute.c_str(), text);
    }
}

void OnEnd(void* user, misc::XmlRecord* stack, int depth)
{
    auto* context = static_cast<LoadContext*>(user);
    misc::XmlRecord& record = stack[depth];
    if (record.userWord2 != EntryDeclaration)
        return;
    auto* declaration = static_cast<FontDeclaration*>(record.user);
    declaration->OnEnd();
    if (context->seen.insert(declaration->m_Id).second)
        return;
    // The first declaration of an id wins; this one is the last of its group.
    OX_LOG("resdecl", diag::LogWarning, u"Resource declaration \"%ls\" already loaded.",
           misc::ConvertToWide(declaration->m_Id->view()).c_str());
    ResourceGroup* group = declaration->m_Group;
    record.user = nullptr;
    record.userWord2 = EntryNone;
    if (group && !group->m_Declarations.empty() && &group->m_Declarations.back() == declaration)
        group->m_Declarations.pop_back();
}

} // namespace

void CResourceDeclarations::LoadFromMemory(const char* data, size_t size, const char* name, const char* group)
{
    ResourceGroup* target = this;
    if (group) {
        target = FindGroup(group);
        if (!target) {
            m_Groups.push_back(std::make_unique<ResourceGroup>());
            target = m_Groups.back().get();
            target->m_Id = InternDeclarationId(group);
        }
    }
    LoadContext context;
    context.target = target;
    context.name = name;
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
