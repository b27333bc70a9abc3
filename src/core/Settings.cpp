#include "core/Settings.h"

#include "misc/GamePack.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/Unicode.h"
#include "misc/XmlParser.h"

#include <boost/make_shared.hpp>

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <set>

namespace ox::core {

namespace {

using misc::StringA88;

struct NameLess {
    using is_transparent = void;
    bool operator()(const InternedName& a, const InternedName& b) const { return a.name.view() < b.name.view(); }
    bool operator()(const InternedName& a, std::string_view b) const { return a.name.view() < b; }
    bool operator()(std::string_view a, const InternedName& b) const { return a < b.name.view(); }
};

// Never destroyed: trees in static objects may outlive any other static.
std::set<InternedName, NameLess>& IdPool()
{
    static auto* pool = new std::set<InternedName, NameLess>();
    return *pool;
}

// Takes a reference to the identifier of `name`, creating it at first sight.
const InternedName& Acquire(std::string_view name)
{
    OX_ASSERT(name.size() <= kMaxIdLength);
    if (name.size() > kMaxIdLength)
        name = name.substr(0, kMaxIdLength);
    if (name.empty())
        name = ""; // a fixed string must not be made from a null pointer
    auto& pool = IdPool();
    auto where = pool.find(name);
    if (where == pool.end())
        where = pool.insert(InternedName{StringA88(name)}).first;
    ++where->refs;
    return *where;
}

// Held forever: the empty identifier is what every unnamed node and every miss refers to.
const InternedName& EmptyEntry()
{
    static const InternedName& empty = Acquire({});
    return empty;
}

} // namespace

SettingsId::SettingsId() : m_Entry(&EmptyEntry()) { ++m_Entry->refs; }

SettingsId::SettingsId(std::string_view name) : m_Entry(&Acquire(name)) {}

SettingsId::SettingsId(const SettingsId& other) : m_Entry(other.m_Entry)
{
    if (m_Entry)
        ++m_Entry->refs;
}

SettingsId::~SettingsId()
{
    if (!m_Entry)
        return; // moved from
    OX_ASSERT(m_Entry->refs > 0);
    if (--m_Entry->refs == 0) {
        auto& pool = IdPool();
        pool.erase(pool.find(m_Entry->name.view()));
    }
}

const StringA88* InternId(std::string_view name) { return &Acquire(name).name; }

const StringA88* FindId(std::string_view name)
{
    auto& pool = IdPool();
    auto where = pool.find(name);
    return where == pool.end() ? nullptr : &where->name;
}

const StringA88& EmptyId() { return EmptyEntry().name; }

size_t IdCount() { return IdPool().size(); }

// ---------------------------------------------------------------------------------------
// CSettingsGroup

CSettingsGroup::CSettingsGroup() = default;

CSettingsGroup::CSettingsGroup(const String& id) : m_Id(id.view()) {}

CSettingsGroup::~CSettingsGroup()
{
    for (auto& child : m_Children)
        child->m_Parent = nullptr;
}

const CSettingsGroup& CSettingsGroup::Empty()
{
    static const CSettingsGroup* empty = new CSettingsGroup();
    return *empty;
}

const std::string& CSettingsGroup::EmptyString()
{
    static const std::string* empty = new std::string();
    return *empty;
}

void CSettingsGroup::AddChild(SettingsGroupPtrT child, const String& name)
{
    OX_ASSERT(child);
    if (!child)
        return;
    child->m_Parent = this;
    if (!name.empty())
        m_NamedChildren.emplace_back(SettingsId(name.view()), child);
    m_Children.push_back(std::move(child));
}

void CSettingsGroup::RemoveChild(const CSettingsGroup& child)
{
    auto where = std::find_if(m_Children.begin(), m_Children.end(),
                              [&](const SettingsGroupPtrT& p) { return p.get() == &child; });
    if (where == m_Children.end())
        return;
    auto named = std::find_if(m_NamedChildren.begin(), m_NamedChildren.end(),
                              [&](const NamedChild& p) { return p.second.get() == &child; });
    if (named != m_NamedChildren.end())
        m_NamedChildren.erase(named);
    (*where)->m_Parent = nullptr;
    m_Children.erase(where); // may destroy the child: `child` is not used below
}

unsigned CSettingsGroup::EnumChildren(const String& name) const
{
    if (name.empty())
        return static_cast<unsigned>(m_Children.size());
    const String* id = FindId(name.view());
    if (!id)
        return 0;
    return static_cast<unsigned>(std::count_if(m_Children.begin(), m_Children.end(),
                                               [id](const SettingsGroupPtrT& p) { return p->m_Id.get() == id; }));
}

const CSettingsGroup& CSettingsGroup::GetFirstChild() const
{
    const CSettingsGroup* found = GetFirstChildRef();
    return found ? *found : Empty();
}

CSettingsGroup* CSettingsGroup::GetFirstChildRef() const
{
    return m_Children.empty() ? nullptr : m_Children.front().get();
}

CSettingsGroup* CSettingsGroup::FindChild(const String* id, const String* attribute, const std::string* value,
                                          bool recursive) const
{
    for (const auto& child : m_Children) {
        if (child->m_Id.get() == id) {
            if (!attribute)
                return child.get();
            const CSettingsRefCountedConstString* found = child->FindValue(attribute->view());
            if (found && found->Get() == *value)
                return child.get();
        }
        if (recursive && !child->m_Children.empty()) {
            if (CSettingsGroup* deeper = child->FindChild(id, attribute, value, true))
                return deeper;
        }
    }
    return nullptr;
}

CSettingsGroup* CSettingsGroup::GetChildRef(const String& name, bool recursive) const
{
    const String* id = FindId(name.view());
    return id ? FindChild(id, nullptr, nullptr, recursive) : nullptr;
}

const CSettingsGroup& CSettingsGroup::GetChild(const String& name, bool recursive) const
{
    const CSettingsGroup* found = GetChildRef(name, recursive);
    return found ? *found : Empty();
}

CSettingsGroup* CSettingsGroup::GetChildByAttributeRef(const String& element, const String& attribute,
                                                       const std::string& value, bool recursive) const
{
    const String* id = FindId(element.view());
    const String* attributeId = FindId(attribute.view());
    return id && attributeId ? FindChild(id, attributeId, &value, recursive) : nullptr;
}

const CSettingsGroup& CSettingsGroup::GetChildByAttribute(const String& element, const String& attribute,
                                                          const std::string& value, bool recursive) const
{
    const CSettingsGroup* found = GetChildByAttributeRef(element, attribute, value, recursive);
    return found ? *found : Empty();
}

CSettingsGroup* CSettingsGroup::FindNamedChild(const String* id, bool recursive) const
{
    for (const auto& [name, child] : m_NamedChildren) {
        if (name.get() == id)
            return child.get();
        if (recursive && !child->m_NamedChildren.empty()) {
            if (CSettingsGroup* deeper = child->FindNamedChild(id, true))
                return deeper;
        }
    }
    return nullptr;
}

CSettingsGroup* CSettingsGroup::GetNamedChildRef(const String& name, bool recursive) const
{
    const String* id = FindId(name.view());
    return id ? FindNamedChild(id, recursive) : nullptr;
}

const CSettingsGroup& CSettingsGroup::GetNamedChild(const String& name, bool recursive) const
{
    const CSettingsGroup* found = GetNamedChildRef(name, recursive);
    return found ? *found : Empty();
}

CSettingsGroup* CSettingsGroup::GetNextSiblingRef() const
{
    if (m_Id->empty() || !m_Parent)
        return nullptr;
    const auto& siblings = m_Parent->m_Children;
    auto where = std::find_if(siblings.begin(), siblings.end(),
                              [this](const SettingsGroupPtrT& p) { return p.get() == this; });
    if (where == siblings.end() || ++where == siblings.end())
        return nullptr;
    return where->get();
}

const CSettingsGroup& CSettingsGroup::GetNextSibling() const
{
    const CSettingsGroup* found = GetNextSiblingRef();
    return found ? *found : Empty();
}

void CSettingsGroup::AddValue(SettingsId id, std::string_view value)
{
    // The vector is sorted already: inserting behind all equal names is what appending and a
    // stable sort give. Of two equal names the first added stays in front, where the search lands.
    auto where = std::upper_bound(m_Attributes.begin(), m_Attributes.end(), id->view(),
                                  [](std::string_view n, const Attribute& a) { return n < a.first->view(); });
    m_Attributes.emplace(where, std::move(id), CSettingsRefCountedConstString(value));
}

void CSettingsGroup::AddValue(const String& name, const std::string& value) { AddValue(SettingsId(name.view()), value); }

void CSettingsGroup::AddValue(const char* name, const char* value)
{
    OX_ASSERT(name);
    AddValue(String(name ? name : ""), std::string(value ? value : ""));
}

const CSettingsRefCountedConstString* CSettingsGroup::FindValue(std::string_view name) const
{
    auto where = std::lower_bound(m_Attributes.begin(), m_Attributes.end(), name,
                                  [](const Attribute& a, std::string_view n) { return a.first->view() < n; });
    if (where == m_Attributes.end() || where->first->view() != name)
        return nullptr;
    return &where->second;
}

bool CSettingsGroup::IsValue(const String& name) const { return FindValue(name.view()) != nullptr; }

const std::string& CSettingsGroup::GetValue(const String& name) const
{
    const CSettingsRefCountedConstString* found = FindValue(name.view());
    return found ? found->Get() : EmptyString();
}

const CSettingsGroup::String& CSettingsGroup::GetAttribute(unsigned index) const
{
    return index < m_Attributes.size() ? *m_Attributes[index].first : EmptyId();
}

void CSettingsGroup::CopyTo(CSettingsGroup& target) const
{
    target.m_Id = m_Id;
    // A snapshot: the target may be this node or lie below it.
    const std::vector<SettingsGroupPtrT> children = m_Children;
    const std::vector<NamedChild> named = m_NamedChildren;
    const std::vector<Attribute> attributes = m_Attributes;
    for (const auto& child : children) {
        auto copy = boost::make_shared<CSettingsGroup>();
        child->CopyTo(*copy);
        auto entry = std::find_if(named.begin(), named.end(),
                                  [&](const NamedChild& p) { return p.second == child; });
        target.AddChild(copy, entry != named.end() ? *entry->first : EmptyId());
    }
    target.m_Attributes = attributes;
}

// ---------------------------------------------------------------------------------------
// Loading

namespace {

struct LoadContext {
    CSettings* root;
    const std::string* file;
    const char* data;
    // The pending name of an open "named_object", per depth.
    std::string pendingNames[misc::kXmlMaxDepth];

    unsigned LineOf(const char* where) const
    {
        return misc::XmlLineOf(data, where);
    }

    // Names longer than an identifier holds are cut, with a line in the log; `where` (in the
    // data) gives the line.
    std::string_view CheckedName(const char* name, size_t length, const char* where) const
    {
        if (length > kMaxIdLength) {
            OX_LOG("core", diag::LogWarning, "CSettings::LoadXml %s: name \"%.*s\" at line %u is longer than %u characters, cut",
                   file->c_str(), static_cast<int>(std::min<size_t>(length, 200)), name, LineOf(where),
                   static_cast<unsigned>(kMaxIdLength));
            length = kMaxIdLength;
        }
        return {name, length};
    }
};

CSettingsGroup* NodeOf(const misc::XmlRecord& record) { return static_cast<CSettingsGroup*>(record.user); }
std::string* PendingNameOf(const misc::XmlRecord& record) { return static_cast<std::string*>(record.userWord1); }

} // namespace

struct SettingsLoader {
    static void OnStart(void* user, misc::XmlRecord* stack, int depth)
    {
        auto& context = *static_cast<LoadContext*>(user);
        misc::XmlRecord& record = stack[depth];
        record.user = nullptr;
        record.userWord1 = nullptr;
        std::string_view name(record.name, record.nameLength);

        if (name == "named_object") {
            // Its child becomes a named child of the element around it.
            CSettingsGroup* _current_node = depth > 0 ? NodeOf(stack[depth - 1]) : nullptr;
            OX_ASSERT_A(_current_node != 0);
            if (!_current_node) {
                OX_LOG("core", diag::LogError, "CSettings::LoadXml %s: \"named_object\" at line %u has no element around it, dropped",
                       context.file->c_str(), context.LineOf(record.name));
                return;
            }
            context.pendingNames[depth].clear();
            record.userWord1 = &context.pendingNames[depth];
            return;
        }

        CSettingsGroup* target = nullptr;
        const std::string* underName = nullptr;
        if (depth == 0) {
            target = context.root;
        } else if (CSettingsGroup* parent = NodeOf(stack[depth - 1])) {
            target = parent;
        } else if (std::string* pending = PendingNameOf(stack[depth - 1])) {
            // The node of the element around the named_object (it had one, or the named_object
            // would not be pending).
            target = NodeOf(stack[depth - 2]);
            underName = pending;
        }
        if (!target)
            return; // inside a dropped element: dropped too

        auto node = boost::make_shared<CSettingsGroup>(StringA88(context.CheckedName(record.name, record.nameLength, record.name)));
        record.user = node.get();
        if (underName) {
            std::string_view named(*underName);
            if (named.size() > kMaxIdLength)
                named = context.CheckedName(underName->data(), underName->size(), record.name);
            target->AddChild(std::move(node), StringA88(named));
        } else {
            target->AddChild(std::move(node));
        }
    }

    static void OnAttribute(void* user, misc::XmlRecord* stack, int depth, const char* name, size_t nameLength,
                            const char* value, size_t valueLength, bool)
    {
        auto& context = *static_cast<LoadContext*>(user);
        misc::XmlRecord& record = stack[depth];
        if (CSettingsGroup* node = NodeOf(record)) {
            node->AddValue(SettingsId(context.CheckedName(name, nameLength, name)), std::string_view(value, valueLength));
        } else if (std::string* pending = PendingNameOf(record)) {
            if (std::string_view(name, nameLength) == "name")
                pending->assign(value, valueLength);
        }
    }
};

bool CSettings::Parse(const char* data, size_t size, const std::string& name)
{
    LoadContext context{this, &name, data, {}};
    misc::XmlParseProblem problem;
    bool accepted = misc::ParseXml(data, size, &context, &SettingsLoader::OnStart, &SettingsLoader::OnAttribute,
                                   nullptr, nullptr, nullptr, &problem);
    if (!problem.what.empty())
        OX_LOG("core", diag::LogWarning, "CSettings::LoadXml %s: %s at line %u", name.c_str(), problem.what.c_str(),
               problem.line);
    if (!accepted)
        OX_LOG("core", diag::LogError, "CSettings::LoadXml failed on file %s", name.c_str());
    return accepted;
}

bool CSettings::LoadXmlFromMemory(const char* data, size_t size, const std::string& name)
{
    OX_LOG("core", diag::LogTrace, "CSettings::LoadXml loading %s", name.c_str());
    if (!data) {
        OX_LOG("core", diag::LogError, "CSettings::LoadXml failed on file %s", name.c_str());
        return false;
    }
    return Parse(data, size, name);
}

bool CSettings::LoadXml(const std::string& path)
{
    OX_LOG("core", diag::LogTrace, "CSettings::LoadXml loading %s", path.c_str());
    misc::CGamePack& pack = misc::g_GamePack::Instance();
    unsigned size = 0;
    const void* data = pack.Open(path.c_str(), &size);
    if (!data) {
        OX_LOG("core", diag::LogError, "CSettings::LoadXml failed on file %s", path.c_str());
        return false;
    }
    bool result = Parse(static_cast<const char*>(data), size, path);
    pack.Close(data);
    return result;
}

bool CSettings::LoadXmlDirect(const wstring& path)
{
    namespace fs = std::filesystem;
    std::error_code error;
    fs::path file = fs::absolute(fs::path(misc::WideToUtf8(path)), error);
    if (error)
        file = fs::path(misc::WideToUtf8(path));
    const std::string shown = file.string();
    const wstring wide = misc::Utf8ToWide(shown);
    OX_LOG("core", diag::LogTrace, u"CSettings::LoadXml loading %ls", wide.c_str());

    std::string bytes;
    bool read = false;
    if (FILE* in = fopen(shown.c_str(), "rb")) {
        char buffer[65536];
        size_t n;
        while ((n = fread(buffer, 1, sizeof buffer, in)) > 0)
            bytes.append(buffer, n);
        read = !ferror(in);
        fclose(in);
    }
    if (!read) {
        OX_LOG("core", diag::LogError, u"CSettings::LoadXml failed on file %ls", wide.c_str());
        return false;
    }
    return Parse(bytes.data(), bytes.size(), shown);
}

} // namespace ox::core
