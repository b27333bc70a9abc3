#pragma once
// Fixed-capacity strings with a stored length and a cached 16-bit hash. They hold no
// pointers and keep one byte layout in memory and in files (pack entries, bindumps):
// an 8-byte header (size, max_size, hash, padding) and N characters, N counting the
// terminator.
#include "misc/WideChar.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace ox::misc {

// 16-bit hash of a text read as little-endian 16-bit words; an odd byte count takes in the
// terminator's byte. Never 0: a computed hash of 0 is stored as 1.
uint16_t CalcHash(const void* data, size_t bytes);

// The untyped core. Every operation that touches characters takes the character size.
struct BasicString {
    uint16_t size;
    uint16_t max_size;
    uint16_t hash;
    uint16_t padding;

    void* Data() { return reinterpret_cast<char*>(this) + sizeof(BasicString); }
    const void* Data() const { return reinterpret_cast<const char*>(this) + sizeof(BasicString); }

    void Clear(size_t _char_size);
    void RawAssign(const void* text, size_t _char_size);
    void Assign(const void* text, size_t count, size_t _char_size);
    void Assign(const BasicString& other, size_t _char_size);
    void Assign(const BasicString& other, size_t from, size_t count, size_t _char_size);
    void Append(const void* text, size_t _char_size);
    void Append(const BasicString& other, size_t _char_size);
    void Resize(size_t _new_size, uint32_t fill, size_t _char_size);
    void Remove(size_t _remove_from, size_t _remove_to, size_t _char_size);
    int Find(const void* text, size_t _off, size_t _char_size) const;
    int Compare(const void* text, size_t _char_size) const;
    bool Equal(const BasicString& other, size_t _char_size) const;
    bool Empty() const { return size == 0; }
    // The stored hash, computed and stored first if it is 0.
    uint16_t GetHash(size_t _char_size) const;

protected:
    void Init(uint16_t capacity);
    void AppendChars(const void* text, size_t len, size_t _char_size);
};
static_assert(sizeof(BasicString) == 8);

template <class C, size_t N>
struct String : BasicString {
    static_assert(sizeof(C) == 1 || sizeof(C) == 2, "narrow or 16-bit wide characters only");
    static_assert(N > 0 && N < 0x10000);
    static constexpr size_t kCapacity = N;
    static constexpr size_t kCharSize = sizeof(C);

    C m_Data[N];

    String() { Init(N); Clear(kCharSize); }
    String(const C* text) { Init(N); RawAssign(text, kCharSize); }
    String(std::basic_string_view<C> text) { Init(N); Assign(text.data(), text.size(), kCharSize); }
    String(const std::basic_string<C>& text) { Init(N); Assign(text.data(), text.size(), kCharSize); }
    template <size_t M> String(const String<C, M>& other) { Init(N); BasicString::Assign(other, kCharSize); }

    String& operator=(const C* text) { RawAssign(text, kCharSize); return *this; }
    String& operator=(std::basic_string_view<C> text) { BasicString::Assign(text.data(), text.size(), kCharSize); return *this; }
    template <size_t M> String& operator=(const String<C, M>& other) { BasicString::Assign(other, kCharSize); return *this; }

    void clear() { Clear(kCharSize); }
    const C* c_str() const { return m_Data; }
    bool empty() const { return size == 0; }
    size_t length() const { return size; }
    std::basic_string_view<C> view() const { return {m_Data, size}; }
    std::basic_string<C> str() const { return std::basic_string<C>(m_Data, size); }

    void Append(const C* text) { BasicString::Append(text, kCharSize); }
    template <size_t M> void Append(const String<C, M>& other) { BasicString::Append(other, kCharSize); }
    void Resize(size_t new_size, C fill = 0) { BasicString::Resize(new_size, static_cast<uint32_t>(fill), kCharSize); }
    void Remove(size_t from, size_t to) { BasicString::Remove(from, to, kCharSize); }
    int Find(const C* text, size_t offset = 0) const { return BasicString::Find(text, offset, kCharSize); }
    int Compare(const C* text) const { return BasicString::Compare(text, kCharSize); }
    uint16_t Hash() const { return GetHash(kCharSize); }

    template <size_t M> bool operator==(const String<C, M>& other) const { return Equal(other, kCharSize); }
    bool operator==(const C* text) const { return Compare(text) == 0; }
    // Ordering by text, for sorted tables of ids.
    template <size_t M> bool operator<(const String<C, M>& other) const { return Compare(other.m_Data) < 0; }
};

using StringA24 = String<char, 24>;
using StringA32 = String<char, 32>;
using StringA40 = String<char, 40>;
using StringA56 = String<char, 56>;
using StringA88 = String<char, 88>;
using StringA112 = String<char, 112>;
using StringA120 = String<char, 120>;
using StringW28 = String<wchar, 28>;
using StringW60 = String<wchar, 60>;
using StringW124 = String<wchar, 124>;

static_assert(sizeof(StringA24) == 32);
static_assert(sizeof(StringA88) == 96);
static_assert(sizeof(StringA112) == 120);
static_assert(sizeof(StringW28) == 64);
static_assert(sizeof(StringW124) == 256);
static_assert(sizeof(StringW60) == 8 + 60 * 2);

// A fixed string read from a file can be used in place: its capacity as declared, its size
// inside it, its text terminated where the size says and free of zeros before that.
template <class C, size_t N>
bool IsStoredStringValid(const String<C, N>& s)
{
    if (s.max_size != N || s.size >= N || s.m_Data[s.size] != 0)
        return false;
    for (size_t i = 0; i < s.size; ++i)
        if (s.m_Data[i] == 0)
            return false;
    return true;
}

} // namespace ox::misc
