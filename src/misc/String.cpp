#include "misc/String.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/Unicode.h"

#include <cstring>

namespace ox::misc {

namespace {

uint32_t CharAt(const void* data, size_t index, size_t char_size)
{
    if (char_size == 1)
        return static_cast<const unsigned char*>(data)[index];
    uint16_t c;
    memcpy(&c, static_cast<const char*>(data) + index * 2, 2);
    return c;
}

void SetChar(void* data, size_t index, uint32_t c, size_t char_size)
{
    if (char_size == 1) {
        static_cast<unsigned char*>(data)[index] = static_cast<unsigned char>(c);
    } else {
        uint16_t w = static_cast<uint16_t>(c);
        memcpy(static_cast<char*>(data) + index * 2, &w, 2);
    }
}

size_t TextLength(const void* text, size_t char_size)
{
    size_t n = 0;
    while (CharAt(text, n, char_size))
        ++n;
    return n;
}

#define OX_CHECK_CHAR_SIZE() OX_ASSERT(_char_size == sizeof(char) || _char_size == sizeof(wchar))

} // namespace

uint16_t CalcHash(const void* data, size_t bytes)
{
    if (bytes & 1)
        ++bytes;
    const auto* p = static_cast<const unsigned char*>(data);
    uint32_t h = 0;
    for (size_t i = 0; i < bytes; i += 2) {
        uint32_t w = p[i] | (p[i + 1] << 8);
        h = (h >> 1) + ((h & 1) << 15);
        h = (h + w) & 0xFFFF;
    }
    return h == 0 ? 1 : static_cast<uint16_t>(h);
}

void BasicString::Init(uint16_t capacity)
{
    size = 0;
    max_size = capacity;
    hash = 0;
    padding = 0;
}

void BasicString::Clear(size_t _char_size)
{
    OX_ASSERT(max_size != 0);
    OX_CHECK_CHAR_SIZE();
    memset(Data(), 0, max_size * _char_size);
    size = 0;
    hash = 0;
}

void BasicString::Assign(const void* text, size_t len, size_t _char_size)
{
    OX_ASSERT(max_size != 0);
    OX_CHECK_CHAR_SIZE();
    if (!(len + 1 <= max_size)) {
        if (_char_size == 1) {
            std::string shown(static_cast<const char*>(text), len);
            OX_LOG("ox", diag::LogError, "BasicString::RawAssign (len + 1 > max_size): %s", shown.c_str());
        }
        OX_ASSERT(len + 1 <= max_size);
        len = max_size - 1; // cut to the capacity
    }
    if (len)
        memmove(Data(), text, len * _char_size);
    SetChar(Data(), len, 0, _char_size);
    size = static_cast<uint16_t>(len);
    hash = 0;
}

void BasicString::RawAssign(const void* text, size_t _char_size)
{
    OX_CHECK_CHAR_SIZE();
    Assign(text, TextLength(text, _char_size), _char_size);
}

void BasicString::Assign(const BasicString& other, size_t _char_size)
{
    if (&other == this)
        return;
    Assign(other.Data(), other.size, _char_size);
}

void BasicString::Assign(const BasicString& other, size_t from, size_t count, size_t _char_size)
{
    OX_ASSERT(from <= other.size);
    if (from > other.size)
        from = other.size;
    if (count > other.size - from)
        count = other.size - from;
    Assign(static_cast<const char*>(other.Data()) + from * _char_size, count, _char_size);
}

// Appends `len` characters, cut to the capacity once the caller's contract check has fired.
void BasicString::AppendChars(const void* text, size_t len, size_t _char_size)
{
    if (size + len >= max_size)
        len = max_size - 1 - size;
    memmove(static_cast<char*>(Data()) + size * _char_size, text, len * _char_size);
    size = static_cast<uint16_t>(size + len);
    SetChar(Data(), size, 0, _char_size);
    hash = 0;
}

void BasicString::Append(const void* text, size_t _char_size)
{
    OX_ASSERT(max_size != 0);
    OX_CHECK_CHAR_SIZE();
    size_t len = TextLength(text, _char_size);
    size_t sz = size + len;
    OX_ASSERT(sz + 1 <= max_size);
    AppendChars(text, len, _char_size);
}

void BasicString::Append(const BasicString& other, size_t _char_size)
{
    OX_ASSERT(max_size != 0);
    OX_CHECK_CHAR_SIZE();
    OX_ASSERT(size + other.size < max_size);
    AppendChars(other.Data(), other.size, _char_size);
}

void BasicString::Resize(size_t _new_size, uint32_t fill, size_t _char_size)
{
    OX_ASSERT(max_size != 0);
    OX_CHECK_CHAR_SIZE();
    OX_ASSERT(_new_size < max_size);
    if (_new_size >= max_size)
        _new_size = max_size - 1;
    for (size_t i = size; i < _new_size; ++i)
        SetChar(Data(), i, fill, _char_size);
    size = static_cast<uint16_t>(_new_size);
    SetChar(Data(), size, 0, _char_size);
    hash = 0;
}

void BasicString::Remove(size_t _remove_from, size_t _remove_to, size_t _char_size)
{
    OX_ASSERT(max_size != 0);
    OX_CHECK_CHAR_SIZE();
    OX_ASSERT(_remove_from < size);
    OX_ASSERT(_remove_from <= _remove_to);
    if (_remove_from >= size || _remove_from > _remove_to)
        return;
    if (_remove_to > size)
        _remove_to = size;
    if (_remove_to == _remove_from)
        return; // nothing removed: the hash stays valid
    char* base = static_cast<char*>(Data());
    memmove(base + _remove_from * _char_size, base + _remove_to * _char_size, (size - _remove_to) * _char_size);
    size = static_cast<uint16_t>(size - (_remove_to - _remove_from));
    SetChar(Data(), size, 0, _char_size);
    hash = 0;
}

int BasicString::Find(const void* text, size_t _off, size_t _char_size) const
{
    OX_ASSERT(max_size != 0);
    OX_CHECK_CHAR_SIZE();
    OX_ASSERT(_off < size);
    size_t len = TextLength(text, _char_size);
    if (len == 0)
        return _off <= size ? static_cast<int>(_off) : -1;
    for (size_t i = _off; i + len <= size; ++i) {
        size_t k = 0;
        while (k < len && CharAt(Data(), i + k, _char_size) == CharAt(text, k, _char_size))
            ++k;
        if (k == len)
            return static_cast<int>(i);
    }
    return -1;
}

int BasicString::Compare(const void* text, size_t _char_size) const
{
    OX_ASSERT(max_size != 0);
    OX_CHECK_CHAR_SIZE();
    for (size_t sz = 0;; ++sz) {
        uint32_t c2 = CharAt(text, sz, _char_size);
        if (!(c2 == 0 || sz < max_size)) {
            OX_ASSERT(c2 == 0 || sz < max_size);
            return -1;
        }
        uint32_t c1 = sz < size ? CharAt(Data(), sz, _char_size) : 0;
        if (c1 != c2)
            return c1 < c2 ? -1 : 1;
        if (c2 == 0)
            return 0;
    }
}

uint16_t BasicString::GetHash(size_t _char_size) const
{
    if (hash == 0)
        const_cast<BasicString*>(this)->hash = CalcHash(Data(), size * _char_size);
    return hash;
}

bool BasicString::Equal(const BasicString& other, size_t _char_size) const
{
    OX_ASSERT(max_size != 0);
    OX_CHECK_CHAR_SIZE();
    if (size != other.size)
        return false;
    GetHash(_char_size);
    other.GetHash(_char_size);
    OX_ASSERT(CalcHash(((char*)this) + sizeof(*this), size * _char_size) == hash);
    if (hash != other.hash)
        return false;
    return Compare(other.Data(), _char_size) == 0;
}

} // namespace ox::misc
