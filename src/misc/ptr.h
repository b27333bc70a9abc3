#pragma once
// Base of every object shared through boost::intrusive_ptr. The count is 8 bits wide and
// belongs to the main thread; a plain pointer to such an object is a non-owning link.
#include "diag/Assert.h"

#include <boost/intrusive_ptr.hpp>

#include <cstdint>

namespace ox::misc {

class CRefCountedObj {
public:
    CRefCountedObj() = default;
    // A copy is a new object: it starts without references.
    CRefCountedObj(const CRefCountedObj&) {}
    CRefCountedObj& operator=(const CRefCountedObj&) { return *this; }
    virtual ~CRefCountedObj() = default;

    uint8_t GetRefCount() const { return m_RefCount; }

    void AddRef() const
    {
        OX_ASSERT(m_RefCount < 255);
        ++m_RefCount;
    }

    // The last release deletes the object.
    void Release() const
    {
        if (--m_RefCount == 0)
            delete this;
    }

private:
    mutable uint8_t m_RefCount = 0;
};

inline void intrusive_ptr_add_ref(const CRefCountedObj* object) { object->AddRef(); }
inline void intrusive_ptr_release(const CRefCountedObj* object) { object->Release(); }

} // namespace ox::misc
