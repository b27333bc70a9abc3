#pragma once
// Attribute values of the settings tree. Values repeat very often, so each text is kept once
// in one of 17 pools (by length: 0 to 15, and 16 for everything longer) with a reference
// count; the handle below adds and takes references. Entries whose count falls to 0 stay in
// their pool until a collection erases them. Main thread only.
#include <cstdint>
#include <map>
#include <string>
#include <string_view>

namespace ox::core {

// Characters (plus one terminator each) in all pool entries, and in those in use.
extern uint32_t g_CharsAllocatedTotal;
extern uint32_t g_CharsUsedNow;

class CSettingsRefCountedConstString {
public:
    using Pool = std::map<std::string, int32_t, std::less<>>;
    static constexpr size_t kPoolCount = 17;

    // The empty text.
    CSettingsRefCountedConstString();
    explicit CSettingsRefCountedConstString(std::string_view text);
    explicit CSettingsRefCountedConstString(const char* text);
    CSettingsRefCountedConstString(const CSettingsRefCountedConstString& other);
    CSettingsRefCountedConstString& operator=(const CSettingsRefCountedConstString& other);
    ~CSettingsRefCountedConstString();

    const std::string& Get() const { return m_Where->first; }
    int32_t GetRefCount() const { return m_Where->second; }

    // Erases every entry with no reference from all pools (a release runs it by itself once
    // the unused share passes 10% of more than 4096 characters).
    static void CollectGarbage();
    // Entries in all pools, used or not.
    static size_t EntryCount();
    // The pool a text of `length` characters lives in.
    static size_t PoolIndex(size_t length) { return length < kPoolCount - 1 ? length : kPoolCount - 1; }
    static const Pool& GetPool(size_t index);

private:
    void AddRef();
    static void Release(Pool::iterator _where);

    Pool::iterator m_Where;
};

} // namespace ox::core
