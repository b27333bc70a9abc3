#pragma once
// Read-only memory-mapped files. Every live mapping holds one slot of a fixed table, so
// a pointer given out here is all a caller needs to get the size back or to release it.
#include "misc/WideChar.h"

#include <cstddef>

namespace ox::misc::sys {

// The number of files that can be mapped at once.
constexpr size_t kMaxMappedFiles = 256;

// Maps a whole regular file read-only. Null if it cannot be opened, is empty or not a
// regular file, or if every slot is taken (an assertion). `size` may be null.
const void* MapFile(const char* path, unsigned* size);
const void* MapFile(const wchar* path, unsigned* size);

// Releases a mapping made by MapFile. Null or an unknown pointer is a contract failure.
void UnmapFile(const void* _map);

// The size of a mapping made by MapFile; 0 (and an assertion) for an unknown pointer.
unsigned GetMappedSize(const void* _map);

// The number of slots in use.
size_t MappedFileCount();

} // namespace ox::misc::sys
