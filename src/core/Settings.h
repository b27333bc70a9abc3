#pragma once
// The settings tree: XML elements become nodes, attributes become pooled string values.
// Element and attribute names are interned: equal names share one identifier object, so
// names compare by address; an identifier goes when no tree uses it any more. Look-ups that find nothing return static empty objects, so that
// calls chain without tests; the "Ref" forms return null instead.
#include "core/SettingsValue.h"
#include "misc/String.h"
#include "misc/WideChar.h"

#include <boost/shared_ptr.hpp>

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace ox::core {

class CSettingsGroup;
struct SettingsLoader;
using SettingsGroupPtrT = boost::shared_ptr<CSettingsGroup>;

// The longest name an identifier holds.
constexpr size_t kMaxIdLength = misc::StringA88::kCapacity - 1;

// An interned name and the number of references to it.
struct InternedName {
    misc::StringA88 name;
    mutable size_t refs = 0;
};

// A counted reference to an identifier: equal names share one identifier, which lives while a
// reference to it does (a tree holds one per node id and attribute name), so names that no
// tree uses any more are released.
class SettingsId {
public:
    // The empty identifier.
    SettingsId();
    // The identifier of `name` (at most kMaxIdLength characters), created at first sight.
    explicit SettingsId(std::string_view name);
    SettingsId(const SettingsId& other);
    SettingsId(SettingsId&& other) noexcept : m_Entry(other.m_Entry) { other.m_Entry = nullptr; }
    SettingsId& operator=(SettingsId other) noexcept
    {
        std::swap(m_Entry, other.m_Entry);
        return *this;
    }
    ~SettingsId();

    const misc::StringA88* get() const { return &m_Entry->name; }
    const misc::StringA88& operator*() const { return m_Entry->name; }
    const misc::StringA88* operator->() const { return &m_Entry->name; }

private:
    const InternedName* m_Entry;
};

// The identifier of `name` (at most kMaxIdLength characters), created at first sight and kept to
// the end of the process: for holders that keep bare pointers (declarations).
const misc::StringA88* InternId(std::string_view name);
// The identifier of `name` if one exists, else null.
const misc::StringA88* FindId(std::string_view name);
// The empty identifier.
const misc::StringA88& EmptyId();
// Identifiers that exist now.
size_t IdCount();

class CSettingsGroup {
public:
    using String = misc::StringA88;
    using Attribute = std::pair<SettingsId, CSettingsRefCountedConstString>;
    using NamedChild = std::pair<SettingsId, SettingsGroupPtrT>;

    CSettingsGroup();
    explicit CSettingsGroup(const String& id);
    virtual ~CSettingsGroup();
    CSettingsGroup(const CSettingsGroup&) = delete;
    CSettingsGroup& operator=(const CSettingsGroup&) = delete;

    const String& GetId() const { return *m_Id; }
    CSettingsGroup* GetParent() const { return m_Parent; }

    // Appends; a non-empty name also enters the child among the named children.
    void AddChild(SettingsGroupPtrT child, const String& name = EmptyId());
    // Removes by identity; a node that is not a child is ignored.
    void RemoveChild(const CSettingsGroup& child);
    // Children with this name; an empty name counts all.
    unsigned EnumChildren(const String& name = EmptyId()) const;

    const CSettingsGroup& GetFirstChild() const;
    CSettingsGroup* GetFirstChildRef() const;
    // The first child with the name; `recursive` searches a non-matching child's subtree
    // before going on to the next child.
    const CSettingsGroup& GetChild(const String& name, bool recursive = false) const;
    CSettingsGroup* GetChildRef(const String& name, bool recursive = false) const;
    // As GetChild, and the child's attribute `attribute` must equal `value`.
    const CSettingsGroup& GetChildByAttribute(const String& element, const String& attribute,
                                              const std::string& value, bool recursive = false) const;
    CSettingsGroup* GetChildByAttributeRef(const String& element, const String& attribute,
                                           const std::string& value, bool recursive = false) const;
    // As GetChild over the named children.
    const CSettingsGroup& GetNamedChild(const String& name, bool recursive = false) const;
    CSettingsGroup* GetNamedChildRef(const String& name, bool recursive = false) const;
    // The child after this one in the parent's list; none for a node with an empty id.
    const CSettingsGroup& GetNextSibling() const;
    CSettingsGroup* GetNextSiblingRef() const;

    // Adds an attribute; the attributes stay sorted by name, and of two equal names the one
    // added first is found.
    void AddValue(const String& name, const std::string& value);
    void AddValue(const char* name, const char* value);
    bool IsValue(const String& name) const;
    // The value, or the empty static string.
    const std::string& GetValue(const String& name) const;
    unsigned EnumAttributes() const { return static_cast<unsigned>(m_Attributes.size()); }
    // The name of attribute `index`, or the empty identifier.
    const String& GetAttribute(unsigned index) const;

    // Deep copy into `target`: its id becomes this id, copies of the children are appended,
    // and the attributes are replaced.
    void CopyTo(CSettingsGroup& target) const;

    // All children in order, for walks over many children.
    const std::vector<SettingsGroupPtrT>& GetChildren() const { return m_Children; }

    static const CSettingsGroup& Empty();
    static const std::string& EmptyString();

private:
    friend struct SettingsLoader;

    void AddValue(SettingsId id, std::string_view value);
    const CSettingsRefCountedConstString* FindValue(std::string_view name) const;
    CSettingsGroup* FindChild(const String* id, const String* attribute, const std::string* value,
                              bool recursive) const;
    CSettingsGroup* FindNamedChild(const String* id, bool recursive) const;

    SettingsId m_Id;
    CSettingsGroup* m_Parent = nullptr;
    std::vector<SettingsGroupPtrT> m_Children;
    std::vector<NamedChild> m_NamedChildren;
    std::vector<Attribute> m_Attributes;
};

// A root: an empty id, and the load operations. Each load adds the file's top-level elements
// as new children, so several files add up.
class CSettings : public CSettingsGroup {
public:
    CSettings() = default;

    // Reads the file through the game pack.
    bool LoadXml(const std::string& path);
    // Parses XML bytes held in memory; `name` names the file in log lines.
    bool LoadXmlFromMemory(const char* data, size_t size, const std::string& name);
    // Reads the file named on disk; a relative path is made absolute from the working folder.
    bool LoadXmlDirect(const wstring& path);

private:
    bool Parse(const char* data, size_t size, const std::string& name);
};

} // namespace ox::core
