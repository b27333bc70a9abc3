#pragma once
// A plain block allocator for many small objects that die together: blocks of a fixed size
// in a list, each handing out its memory from the start on. Nothing is aligned and nothing
// is given back singly; Free (or destruction) releases every block.
#include <cstddef>
#include <cstdint>

namespace ox::misc {

class ChunkBuffer {
public:
    ChunkBuffer() = default;
    ~ChunkBuffer() { Free(*this); }
    ChunkBuffer(const ChunkBuffer&) = delete;
    ChunkBuffer& operator=(const ChunkBuffer&) = delete;

    // `size` bytes from the first block with room; a block of `chunk_size` bytes (header
    // included) is added when none has. A request larger than chunk_size - kHeaderSize gets
    // a block of its own. Null only for a size no 32-bit block holds.
    static void* Allocate(ChunkBuffer& head, size_t chunk_size, size_t size);
    static void Free(ChunkBuffer& head);

    void* Allocate(size_t chunk_size, size_t size) { return Allocate(*this, chunk_size, size); }
    void Free() { Free(*this); }
    size_t GetBlockCount() const;

private:
    struct Block {
        Block* next;
        uint32_t size; // the whole block, header included
        uint32_t free;
    };
    // An empty block of `bytes`, header included.
    static Block* NewBlock(size_t bytes);

public:
    static constexpr size_t kHeaderSize = sizeof(Block);

private:
    Block* m_First = nullptr;
};

} // namespace ox::misc
