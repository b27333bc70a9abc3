#include "misc/sys/MemMap.h"

#include "diag/Assert.h"
#include "misc/sys/Path.h"

#include <cstdint>
#include <fcntl.h>
#include <mutex>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

namespace ox::misc::sys {

namespace {

// A null memory pointer marks a free slot. The descriptor is closed right after mapping:
// the mapping keeps the file alive by itself.
struct MappedSlot {
    const void* memory;
    size_t size;
};

MappedSlot g_Slots[kMaxMappedFiles];
std::mutex g_SlotsLock;

MappedSlot* FindSlot(const void* memory)
{
    for (MappedSlot& slot : g_Slots)
        if (slot.memory == memory)
            return &slot;
    return nullptr;
}

} // namespace

const void* MapFile(const char* path, unsigned* size)
{
    if (size)
        *size = 0;
    if (!path)
        return nullptr;

    std::lock_guard<std::mutex> lock(g_SlotsLock);
    MappedSlot* slot = FindSlot(nullptr);
    OX_ASSERT(slot != nullptr);
    if (!slot)
        return nullptr;

    int fd = open(path, O_RDONLY | O_CLOEXEC);
    if (fd < 0)
        return nullptr;
    struct stat info;
    // Sizes are 32-bit in every interface above this one; an empty file cannot be mapped
    // and counts as missing.
    if (fstat(fd, &info) != 0 || !S_ISREG(info.st_mode) || info.st_size <= 0 ||
        static_cast<uint64_t>(info.st_size) >= UINT32_MAX) {
        close(fd);
        return nullptr;
    }
    size_t length = static_cast<size_t>(info.st_size);
    void* memory = mmap(nullptr, length, PROT_READ, MAP_PRIVATE, fd, 0);
    close(fd);
    if (memory == MAP_FAILED)
        return nullptr;

    slot->memory = memory;
    slot->size = length;
    if (size)
        *size = static_cast<unsigned>(length);
    return memory;
}

const void* MapFile(const wchar* path, unsigned* size)
{
    if (!path) {
        if (size)
            *size = 0;
        return nullptr;
    }
    const void* memory = MapFile(NativePath(path).c_str(), size);
    OX_ASSERT(reinterpret_cast<uintptr_t>(memory) % 4 == 0);
    return memory;
}

void UnmapFile(const void* _map)
{
    OX_ASSERT(_map);
    if (!_map)
        return;
    std::lock_guard<std::mutex> lock(g_SlotsLock);
    MappedSlot* slot = FindSlot(_map);
    OX_ASSERT(slot != nullptr);
    if (!slot)
        return;
    munmap(const_cast<void*>(slot->memory), slot->size);
    slot->memory = nullptr;
    slot->size = 0;
}

unsigned GetMappedSize(const void* _map)
{
    std::lock_guard<std::mutex> lock(g_SlotsLock);
    MappedSlot* slot = _map ? FindSlot(_map) : nullptr;
    OX_ASSERT(slot != nullptr);
    return slot ? static_cast<unsigned>(slot->size) : 0;
}

size_t MappedFileCount()
{
    std::lock_guard<std::mutex> lock(g_SlotsLock);
    size_t count = 0;
    for (const MappedSlot& slot : g_Slots)
        if (slot.memory)
            ++count;
    return count;
}

} // namespace ox::misc::sys
