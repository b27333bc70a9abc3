#pragma once
// A simple walk over a container for scripts: while not it.IsEnd() do it.Get() ... it.Next() end.
// A null container is an empty walk.
#include "diag/Assert.h"

namespace ox::misc {

template <class Container>
class CGenericIterator {
public:
    using value_type = typename Container::value_type;

    CGenericIterator() = default;
    explicit CGenericIterator(Container* container) : m_Container(container)
    {
        if (m_Container)
            m_Iterator = m_Container->begin();
    }

    // At the end (a script error) this gives an empty value instead of reading past it.
    value_type& Get()
    {
        OX_ASSERT(!IsEnd());
        if (IsEnd())
            return Empty();
        return *m_Iterator;
    }
    const value_type& Get() const { return const_cast<CGenericIterator*>(this)->Get(); }
    void Next()
    {
        if (!IsEnd())
            ++m_Iterator;
    }
    bool IsEnd() const { return !m_Container || m_Iterator == m_Container->end(); }

private:
    static value_type& Empty()
    {
        static value_type empty{};
        empty = value_type{};
        return empty;
    }

    Container* m_Container = nullptr;
    typename Container::iterator m_Iterator{};
};

} // namespace ox::misc
