#include "misc/ChunkBuffer.h"

#include "diag/Assert.h"

#include <cstdint>
#include <new>

namespace ox::misc {

void* ChunkBuffer::Allocate(ChunkBuffer& head, size_t chunk_size, size_t size)
{
    OX_ASSERT(chunk_size > kHeaderSize && chunk_size <= UINT32_MAX);
    OX_ASSERT(size <= chunk_size - kHeaderSize);
    if (chunk_size <= kHeaderSize || chunk_size > UINT32_MAX || size > chunk_size - kHeaderSize)
        return nullptr;

    auto newBlock = [chunk_size]() {
        auto* block = static_cast<Block*>(::operator new(chunk_size));
        block->next = nullptr;
        block->size = static_cast<uint32_t>(chunk_size);
        block->free = static_cast<uint32_t>(chunk_size - kHeaderSize);
        return block;
    };
    if (!head.m_First)
        head.m_First = newBlock();
    Block* block = head.m_First;
    while (block->free < size) {
        if (!block->next)
            block->next = newBlock();
        block = block->next;
    }
    void* result = reinterpret_cast<char*>(block) + block->size - block->free;
    block->free -= static_cast<uint32_t>(size);
    return result;
}

void ChunkBuffer::Free(ChunkBuffer& head)
{
    for (Block* block = head.m_First; block;) {
        Block* next = block->next;
        ::operator delete(block);
        block = next;
    }
    head.m_First = nullptr;
}

size_t ChunkBuffer::GetBlockCount() const
{
    size_t count = 0;
    for (const Block* block = m_First; block; block = block->next)
        ++count;
    return count;
}

} // namespace ox::misc
