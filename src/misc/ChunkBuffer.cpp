#include "misc/ChunkBuffer.h"

#include "diag/Assert.h"

#include <algorithm>
#include <cstdint>
#include <new>

namespace ox::misc {

ChunkBuffer::Block* ChunkBuffer::NewBlock(size_t bytes)
{
    auto* block = static_cast<Block*>(::operator new(bytes));
    block->next = nullptr;
    block->size = static_cast<uint32_t>(bytes);
    block->free = static_cast<uint32_t>(bytes - kHeaderSize);
    return block;
}

void* ChunkBuffer::Allocate(ChunkBuffer& head, size_t chunk_size, size_t size)
{
    OX_ASSERT(chunk_size > kHeaderSize && chunk_size <= UINT32_MAX);
    if (chunk_size <= kHeaderSize || chunk_size > UINT32_MAX || size > UINT32_MAX - kHeaderSize)
        return nullptr;

    Block** link = &head.m_First;
    while (*link && (*link)->free < size)
        link = &(*link)->next;
    // At the end of the list a block is added; a request larger than a block's room gets
    // a block of its own size.
    if (!*link)
        *link = NewBlock(std::max(chunk_size, kHeaderSize + size));
    Block* block = *link;
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
