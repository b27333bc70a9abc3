#pragma once
// Resource declarations: a tree of named groups whose leaves declare resources, read from
// XML, and a manager base that turns declarations into items kept by id.
#include "graphics/Color.h"
#include "misc/String.h"

#include <deque>
#include <map>
#include <memory>
#include <string>

namespace ox::core {

using InternedId = const misc::StringA88*;

class ResourceGroup;

class Declaration {
public:
    virtual ~Declaration() = default;
    // Takes one attribute of the declaring element (name matched without regard to case).
    // False when the value cannot be taken (an identifier longer than kMaxIdLength): the
    // loader then drops the declaration.
    virtual bool SetAttribute(const char* name, const std::string& value);
    // The element is complete.
    virtual void OnEnd() {}

    InternedId m_Id;
    ResourceGroup* m_Group = nullptr;

    Declaration();
};

class FontDeclaration : public Declaration {
public:
    bool SetAttribute(const char* name, const std::string& value) override;

    InternedId image;
    std::string file;
    graphics::Color color;

    FontDeclaration();
};

class ResourceGroup {
public:
    ResourceGroup();
    virtual ~ResourceGroup() = default;

    InternedId m_Id;
    uint32_t m_Flags = 0;
    // Stable addresses: the loader keeps pointers to the open group or declaration.
    std::deque<std::unique_ptr<ResourceGroup>> m_Groups;
    std::deque<FontDeclaration> m_Declarations;

    ResourceGroup* FindGroup(const char* id) const;
};

class CResourceDeclarations : public ResourceGroup {
public:
    // Loads the file through the game pack into the root (group null) or into the child
    // group of that name, created when missing. A missing file does nothing.
    void Load(const char* path, const char* group);
    // The same from bytes in memory; `name` is used in log lines.
    void LoadFromMemory(const char* data, size_t size, const char* name, const char* group);
};

// Turns declarations of type D into items of type T, kept by id.
template <class T, class D>
class CResourceManager {
public:
    virtual ~CResourceManager() = default;

    virtual void LoadGroup(const ResourceGroup& group, unsigned* counter)
    {
        for (const auto& child : group.m_Groups)
            LoadGroup(*child, counter);
        for (const D& declaration : group.m_Declarations) {
            T item {};
            if (Load(declaration, item))
                m_Items[declaration.m_Id] = std::move(item);
            if (counter)
                ++*counter;
        }
    }

    virtual void ReloadGroup(const ResourceGroup& group, bool flag, unsigned* counter)
    {
        for (const auto& child : group.m_Groups)
            ReloadGroup(*child, flag, counter);
        for (const D& declaration : group.m_Declarations) {
            auto it = m_Items.find(declaration.m_Id);
            if (it != m_Items.end()) {
                Reload(declaration, it->second, flag);
            } else {
                T item {};
                if (Load(declaration, item))
                    m_Items[declaration.m_Id] = std::move(item);
            }
            if (counter)
                ++*counter;
        }
    }

    virtual bool Load(const D& declaration, T& item) = 0;
    virtual bool Reload(const D& declaration, T& item, bool flag) = 0;

    T* GetItem(const char* id);
    const T* GetItem(const char* id) const { return const_cast<CResourceManager*>(this)->GetItem(id); }
    // The id of an item of this manager, null for any other pointer.
    InternedId GetItemId(const T* item) const
    {
        for (const auto& [id, value] : m_Items)
            if (&value == item)
                return id;
        return nullptr;
    }

protected:
    std::map<InternedId, T> m_Items;
};

// The identifier of an id if one was ever made, else null: a look-up that makes none.
InternedId FindDeclarationId(const char* id);

template <class T, class D>
T* CResourceManager<T, D>::GetItem(const char* id)
{
    auto it = m_Items.find(FindDeclarationId(id));
    return it == m_Items.end() ? nullptr : &it->second;
}

} // namespace ox::core
