#include "core/SettingsValue.h"

#include "diag/Assert.h"
#include "diag/Log.h"

#include <array>

namespace ox::core {

uint32_t g_CharsAllocatedTotal = 0;
uint32_t g_CharsUsedNow = 0;

namespace {

using Pool = CSettingsRefCountedConstString::Pool;

// Never destroyed: handles in static objects may be released during process exit.
std::array<Pool, CSettingsRefCountedConstString::kPoolCount>& Pools()
{
    static auto* pools = new std::array<Pool, CSettingsRefCountedConstString::kPoolCount>();
    return *pools;
}

Pool::iterator Intern(std::string_view text)
{
    Pool& pool = Pools()[CSettingsRefCountedConstString::PoolIndex(text.size())];
    auto where = pool.find(text);
    if (where == pool.end()) {
        where = pool.emplace(std::string(text), 0).first;
        g_CharsAllocatedTotal += static_cast<uint32_t>(text.size() + 1);
    }
    return where;
}

} // namespace

CSettingsRefCountedConstString::CSettingsRefCountedConstString() : m_Where(Intern({})) { AddRef(); }

CSettingsRefCountedConstString::CSettingsRefCountedConstString(std::string_view text) : m_Where(Intern(text))
{
    AddRef();
}

CSettingsRefCountedConstString::CSettingsRefCountedConstString(const char* text)
    : m_Where(Intern(text ? std::string_view(text) : std::string_view()))
{
    AddRef();
}

CSettingsRefCountedConstString::CSettingsRefCountedConstString(const CSettingsRefCountedConstString& other)
    : m_Where(other.m_Where)
{
    AddRef();
}

CSettingsRefCountedConstString& CSettingsRefCountedConstString::operator=(const CSettingsRefCountedConstString& other)
{
    if (m_Where != other.m_Where) {
        Pool::iterator previous = m_Where;
        m_Where = other.m_Where;
        AddRef();
        Release(previous);
    }
    return *this;
}

CSettingsRefCountedConstString::~CSettingsRefCountedConstString() { Release(m_Where); }

void CSettingsRefCountedConstString::AddRef()
{
    if (m_Where->second == 0)
        g_CharsUsedNow += static_cast<uint32_t>(m_Where->first.size() + 1);
    ++m_Where->second;
}

void CSettingsRefCountedConstString::Release(Pool::iterator _where)
{
    OX_ASSERT(g_CharsAllocatedTotal != 0);
    OX_ASSERT(g_CharsUsedNow != 0);
    OX_ASSERT(_where->second > 0);
    if (--_where->second == 0)
        g_CharsUsedNow -= static_cast<uint32_t>(_where->first.size() + 1);
    // The entry is not touched after this point: the collection may erase it. The share is
    // computed in 64 bits so that a total above 42 million characters cannot overflow it.
    if (g_CharsAllocatedTotal > 4096 &&
        (static_cast<uint64_t>(g_CharsAllocatedTotal - g_CharsUsedNow) * 100) / g_CharsAllocatedTotal > 10)
        CollectGarbage();
}

void CSettingsRefCountedConstString::CollectGarbage()
{
    OX_LOG("core", diag::LogTrace, "CSettingsRefCountedConstString strings gc start. bytes: %u", g_CharsAllocatedTotal);
    for (Pool& pool : Pools()) {
        for (auto where = pool.begin(); where != pool.end();) {
            if (where->second == 0) {
                g_CharsAllocatedTotal -= static_cast<uint32_t>(where->first.size() + 1);
                where = pool.erase(where);
            } else {
                ++where;
            }
        }
    }
    OX_LOG("core", diag::LogTrace, "CSettingsRefCountedConstString strings gc end. bytes: %u", g_CharsAllocatedTotal);
}

size_t CSettingsRefCountedConstString::EntryCount()
{
    size_t count = 0;
    for (const Pool& pool : Pools())
        count += pool.size();
    return count;
}

const CSettingsRefCountedConstString::Pool& CSettingsRefCountedConstString::GetPool(size_t index)
{
    OX_ASSERT(index < kPoolCount);
    return Pools()[index < kPoolCount ? index : kPoolCount - 1];
}

} // namespace ox::core
