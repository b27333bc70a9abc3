#pragma once
// The fixed arena from which every Lua state allocates.
//
// Blocks lie in address order, each behind a header of five 32-bit offsets into the arena
// (previous and next block, size with the top bit as "free" flag, next and previous free
// block) padded to 8 bytes; the size excludes the header. Free blocks of 8*i bytes below
// 1024 sit in bin i, bigger ones in one large list; new free blocks go to the head of
// their list. The last header is an end marker of size 0.
#include <cstddef>
#include <cstdint>

namespace ox::lua {

class CLuaHeap {
public:
    // Links are offsets from the start of the arena; None stands for no block.
    struct Block {
        uint32_t Prev;
        uint32_t Next;
        uint32_t Size;
        uint32_t NextFree;
        uint32_t PrevFree;
        uint32_t Padding;
    };
    static constexpr uint32_t None = UINT32_MAX;

    static constexpr size_t HeaderSize = sizeof(Block);
    static constexpr size_t Granularity = 8;
    static constexpr size_t LargeSize = 1024;
    static constexpr unsigned BinCount = LargeSize / Granularity;
    // A block is split only when the rest can hold a header and at least 8 bytes.
    static constexpr size_t SplitReserve = HeaderSize + Granularity;
    static constexpr uint32_t FreeFlag = uint32_t(1) << 31;
    // Sizes and offsets stay below the free flag.
    static constexpr size_t MaxArenaSize = FreeFlag - Granularity;

    // What an exhausted arena does: give null to the caller, or stop the process with a
    // message (the process-wide heap of the Lua states).
    enum class Exhaustion { ReturnNull, StopProcess };

    // An arena of `size` bytes (rounded down to a multiple of 8; at least two headers, at
    // most MaxArenaSize).
    explicit CLuaHeap(size_t size, Exhaustion exhaustion = Exhaustion::ReturnNull);
    ~CLuaHeap();
    CLuaHeap(const CLuaHeap&) = delete;
    CLuaHeap& operator=(const CLuaHeap&) = delete;

    // A block of at least `size` bytes, aligned to 8; null (or the process stops) when
    // nothing fits.
    void* Allocate(size_t size);
    void Free(void* pointer);
    // Size 0 frees (and gives null), null allocates. A block that already fits with less
    // than an eighth of it to spare is kept; otherwise the contents move to a new block.
    void* Reallocate(void* pointer, size_t size);

    // Payload plus one header for every block in use.
    size_t GetUsed() const { return m_Used; }
    size_t GetSize() const { return m_Size; }
    // The payload size of a block that Allocate gave.
    static size_t BlockSize(const void* pointer);
    // Walks blocks and free lists and checks every link, flag, size and the counter.
    bool Check() const;
    // The number of free blocks in the free lists.
    size_t FreeBlockCount() const;

    // The lua_Alloc function; `user` is the heap.
    static void* LuaAlloc(void* user, void* pointer, size_t old_size, size_t new_size);

private:
    static bool IsFree(const Block* block) { return (block->Size & FreeFlag) != 0; }
    static size_t SizeOf(const Block* block) { return block->Size & ~FreeFlag; }
    static Block* BlockOf(const void* pointer);
    static void* PayloadOf(Block* block);
    bool IsEndMarker(const Block* block) const { return block == m_End; }
    Block* At(uint32_t offset) const { return offset == None ? nullptr : reinterpret_cast<Block*>(m_Memory + offset); }
    uint32_t OffsetOf(const Block* block) const
    {
        return block ? static_cast<uint32_t>(reinterpret_cast<const uint8_t*>(block) - m_Memory) : None;
    }

    Block*& ListFor(size_t size);
    void Link(Block* block);
    void Unlink(Block* block);
    // Takes a free block off its list and hands out `size` bytes of it.
    void* Take(Block* block, size_t size, bool split);
    void* Exhausted(size_t size);

    uint8_t* m_Memory;
    size_t m_Size;
    size_t m_Used = 0;
    Exhaustion m_Exhaustion;
    Block* m_First;
    Block* m_End;
    Block* m_Bins[BinCount] = {};
    Block* m_Large = nullptr;
};

// The arena size for when the process-wide heap is made (default 0x500000). Once the heap
// exists this has no effect.
void SetLuaHeapSize(size_t size);
// The process-wide heap, made at first use; it lives until the process ends and stops the
// process when it runs out.
CLuaHeap& GetLuaHeap();
bool LuaHeapExists();

} // namespace ox::lua
