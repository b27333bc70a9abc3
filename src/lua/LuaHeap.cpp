// The Lua arena: binned free lists, first fit for large blocks, coalescing on free.
#include "lua/LuaHeap.h"

#include "diag/Assert.h"
#include "diag/Log.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>

namespace ox::lua {

static_assert(CLuaHeap::HeaderSize == 24, "five 32-bit offsets padded to 8 bytes");
static_assert(CLuaHeap::HeaderSize % CLuaHeap::Granularity == 0, "payloads must stay aligned to 8");

namespace {

constexpr size_t RoundUp(size_t size) { return (size + CLuaHeap::Granularity - 1) & ~(CLuaHeap::Granularity - 1); }

} // namespace

CLuaHeap::CLuaHeap(size_t size, Exhaustion exhaustion) : m_Exhaustion(exhaustion)
{
    size = std::min(size, MaxArenaSize) & ~(Granularity - 1);
    m_Size = std::max(size, 2 * HeaderSize + Granularity);
    m_Memory = static_cast<uint8_t*>(::operator new(m_Size, std::align_val_t(16)));
    m_First = reinterpret_cast<Block*>(m_Memory);
    m_End = reinterpret_cast<Block*>(m_Memory + m_Size - HeaderSize);
    *m_First = {None, OffsetOf(m_End), static_cast<uint32_t>(m_Size - 2 * HeaderSize) | FreeFlag, None, None, 0};
    // The end marker stays "free" and on no list.
    *m_End = {OffsetOf(m_First), None, FreeFlag, None, None, 0};
    Link(m_First);
}

CLuaHeap::~CLuaHeap() { ::operator delete(m_Memory, std::align_val_t(16)); }

CLuaHeap::Block* CLuaHeap::BlockOf(const void* pointer)
{
    return reinterpret_cast<Block*>(const_cast<uint8_t*>(static_cast<const uint8_t*>(pointer)) - HeaderSize);
}

void* CLuaHeap::PayloadOf(Block* block) { return reinterpret_cast<uint8_t*>(block) + HeaderSize; }

size_t CLuaHeap::BlockSize(const void* pointer) { return SizeOf(BlockOf(pointer)); }

CLuaHeap::Block*& CLuaHeap::ListFor(size_t size) { return size < LargeSize ? m_Bins[size / Granularity] : m_Large; }

void CLuaHeap::Link(Block* block)
{
    Block*& head = ListFor(SizeOf(block));
    block->PrevFree = None;
    block->NextFree = OffsetOf(head);
    if (head)
        head->PrevFree = OffsetOf(block);
    head = block;
}

void CLuaHeap::Unlink(Block* block)
{
    if (Block* prev = At(block->PrevFree))
        prev->NextFree = block->NextFree;
    else
        ListFor(SizeOf(block)) = At(block->NextFree);
    if (Block* next = At(block->NextFree))
        next->PrevFree = block->PrevFree;
    block->NextFree = block->PrevFree = None;
}

void* CLuaHeap::Take(Block* block, size_t size, bool split)
{
    Unlink(block);
    size_t available = SizeOf(block);
    if (split && available >= size + SplitReserve) {
        auto* rest = reinterpret_cast<Block*>(static_cast<uint8_t*>(PayloadOf(block)) + size);
        *rest = {OffsetOf(block), block->Next, static_cast<uint32_t>(available - size - HeaderSize) | FreeFlag, None,
                 None, 0};
        At(block->Next)->Prev = OffsetOf(rest);
        block->Next = OffsetOf(rest);
        Link(rest);
        block->Size = static_cast<uint32_t>(size);
    } else {
        block->Size = static_cast<uint32_t>(available);
    }
    m_Used += SizeOf(block) + HeaderSize;
    return PayloadOf(block);
}

void* CLuaHeap::Allocate(size_t size)
{
    if (size > m_Size)
        return Exhausted(size);
    size = RoundUp(std::max<size_t>(size, 1));
    size_t bin = size / Granularity;
    // The exact bin, then the next three bins, taken whole.
    if (size < LargeSize && m_Bins[bin])
        return Take(m_Bins[bin], size, false);
    for (size_t i = bin + 1; i <= bin + 3 && i < BinCount; ++i)
        if (m_Bins[i])
            return Take(m_Bins[i], size, false);
    // First fit among the large blocks, then any bigger bin; both split.
    for (Block* block = m_Large; block; block = At(block->NextFree))
        if (SizeOf(block) >= size)
            return Take(block, size, true);
    for (size_t i = bin + 3; i < BinCount; ++i)
        if (m_Bins[i])
            return Take(m_Bins[i], size, true);
    return Exhausted(size);
}

void CLuaHeap::Free(void* pointer)
{
    if (!pointer)
        return;
    Block* block = BlockOf(pointer);
    OX_ASSERT(!IsFree(block));
    if (IsFree(block))
        return;
    m_Used -= SizeOf(block) + HeaderSize;
    block->Size |= FreeFlag;
    for (;;) {
        Block* prev = At(block->Prev);
        if (prev && IsFree(prev)) {
            Unlink(prev);
            prev->Size = static_cast<uint32_t>(SizeOf(prev) + SizeOf(block) + HeaderSize) | FreeFlag;
            prev->Next = block->Next;
            At(block->Next)->Prev = OffsetOf(prev);
            block = prev;
            continue;
        }
        Block* next = At(block->Next);
        if (IsFree(next) && !IsEndMarker(next)) {
            Unlink(next);
            block->Size = static_cast<uint32_t>(SizeOf(block) + SizeOf(next) + HeaderSize) | FreeFlag;
            block->Next = next->Next;
            At(next->Next)->Prev = OffsetOf(block);
            continue;
        }
        Link(block);
        return;
    }
}

void* CLuaHeap::Reallocate(void* pointer, size_t size)
{
    if (size == 0) {
        Free(pointer);
        return nullptr;
    }
    if (!pointer)
        return Allocate(size);
    size_t old = BlockSize(pointer);
    size_t wanted = RoundUp(size);
    if (old >= wanted && old - wanted < old / 8)
        return pointer;
    Exhaustion mode = m_Exhaustion;
    m_Exhaustion = Exhaustion::ReturnNull;
    void* moved = Allocate(size);
    m_Exhaustion = mode;
    if (!moved) {
        // A block that shrinks may stay where it is.
        if (old >= wanted)
            return pointer;
        return Exhausted(size);
    }
    std::memcpy(moved, pointer, std::min(old, size));
    Free(pointer);
    return moved;
}

void* CLuaHeap::Exhausted(size_t size)
{
    if (m_Exhaustion == Exhaustion::ReturnNull)
        return nullptr;
    OX_LOG("lua", diag::LogError, "Lua heap exhausted: %zu bytes requested, %zu of %zu bytes in use", size, m_Used,
           m_Size);
    diag::Log::Instance().Flush();
    fprintf(stderr, "Lua heap exhausted: %zu bytes requested, %zu of %zu bytes in use; stopping.\n", size, m_Used,
            m_Size);
    fflush(stderr);
    std::abort();
}

bool CLuaHeap::Check() const
{
    size_t used = 0;
    size_t free_blocks = 0;
    const Block* prev = nullptr;
    const Block* block = m_First;
    while (block != m_End) {
        if (!block || block->Prev != OffsetOf(prev))
            return false;
        const uint8_t* end = reinterpret_cast<const uint8_t*>(block) + HeaderSize + SizeOf(block);
        if (reinterpret_cast<const uint8_t*>(At(block->Next)) != end || end > reinterpret_cast<const uint8_t*>(m_End))
            return false;
        if (IsFree(block)) {
            // Neighbours that are both free should have joined.
            if (prev && IsFree(prev))
                return false;
            ++free_blocks;
        } else {
            used += SizeOf(block) + HeaderSize;
        }
        prev = block;
        block = At(block->Next);
    }
    if (m_End->Prev != OffsetOf(prev) || m_End->Next != None || m_End->Size != FreeFlag)
        return false;
    if (used != m_Used)
        return false;
    size_t listed = 0;
    auto check_list = [&](const Block* head, size_t bin, bool large) {
        const Block* before = nullptr;
        for (const Block* b = head; b; b = At(b->NextFree)) {
            if (!IsFree(b) || b->PrevFree != OffsetOf(before) || b == m_End)
                return false;
            if (large ? SizeOf(b) < LargeSize : SizeOf(b) != bin * Granularity)
                return false;
            before = b;
            ++listed;
        }
        return true;
    };
    for (unsigned i = 0; i < BinCount; ++i)
        if (!check_list(m_Bins[i], i, false))
            return false;
    if (!check_list(m_Large, 0, true))
        return false;
    return listed == free_blocks;
}

size_t CLuaHeap::FreeBlockCount() const
{
    size_t count = 0;
    for (unsigned i = 0; i < BinCount; ++i)
        for (const Block* b = m_Bins[i]; b; b = At(b->NextFree))
            ++count;
    for (const Block* b = m_Large; b; b = At(b->NextFree))
        ++count;
    return count;
}

void* CLuaHeap::LuaAlloc(void* user, void* pointer, size_t /*old_size*/, size_t new_size)
{
    auto* heap = static_cast<CLuaHeap*>(user);
    if (new_size == 0) {
        heap->Free(pointer);
        return nullptr;
    }
    return heap->Reallocate(pointer, new_size);
}

namespace {

size_t g_LuaHeapSize = 0x500000;
CLuaHeap* g_LuaHeap = nullptr;

} // namespace

void SetLuaHeapSize(size_t size)
{
    if (g_LuaHeap) {
        OX_LOG("lua", diag::LogWarning, "SetLuaHeapSize(%zu): the Lua heap exists already with %zu bytes", size,
               g_LuaHeap->GetSize());
        return;
    }
    g_LuaHeapSize = size;
}

CLuaHeap& GetLuaHeap()
{
    if (!g_LuaHeap)
        g_LuaHeap = new CLuaHeap(g_LuaHeapSize, CLuaHeap::Exhaustion::StopProcess);
    return *g_LuaHeap;
}

bool LuaHeapExists() { return g_LuaHeap != nullptr; }

} // namespace ox::lua
