#pragma once
// Base of everything shared through boost::intrusive_ptr. The count is 8 bits and starts at
// 0; the object deletes itself when the last reference goes. Main thread only.
#include "diag/Assert.h"

#include <boost/intrusive_ptr.hpp>

#include <cstdint>

namespace ox::misc {

class CRefCountedObj {
public:
    CRefCountedObj() = default;
    // A copy is a new object: it starts with no references.
    CRefCountedObj(const CRefCountedObj&) {}
    CRefCountedObj& operator=(const CRefCountedObj&) { return *this; }
    virtual ~CRefCountedObj() = default;

    uint8_t GetRefCount() const { return m_RefCount; }

    friend void intrusive_ptr_add_ref(CRefCountedObj* object)
    {
        OX_ASSERT(object->m_RefCount < 255);
        ++object->m_RefCount;
    }
    friend void intrusive_ptr_release(CRefCountedObj* object)
    {
        if (--object->m_RefCount == 0)
            delete object;
    }

private:
    uint8_t m_RefCount = 0;
};

} // namespace ox::misc
