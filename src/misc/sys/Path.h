#pragma once
// Small file and path helpers on wide paths. Wide paths are UTF-16; the file system sees
// them as UTF-8 with "\" read as a separator.
#include "misc/WideChar.h"

#include <cstdint>
#include <cstdio>
#include <functional>
#include <string>
#include <vector>

namespace ox::misc::sys {

// The path as the file system takes it: UTF-8, every "\" turned into "/".
std::string NativePath(const wstring& path);
std::string NativePath(const std::string& path);

// Joins two paths with one "/" between them: separators at the end of the first part and
// at the start of the second are dropped. An empty part gives the other one.
wstring AppendPath(const wstring& first, const wstring& second);

bool CheckExistPath(const wstring& path);

// The working folder; empty if it cannot be read.
wstring GetCurrentDirectory();
bool SetCurrentDirectory(const wstring& path);

// The file CRC of this system: the reflected CRC-32 table (polynomial 0xEDB88320) with a
// start value of 0 and no final inversion, so not the common CRC-32.
uint32_t CalcCRC(const void* data, size_t size, uint32_t crc = 0);
// The CRC of a whole file, -1 if it cannot be mapped (missing or empty).
int CalcFileCRC(const wstring& path);

// Full access for the owning user: read and write, and search for folders (u+rwX); group
// and others lose write access and gain nothing. With `inherit`, what a folder holds now is
// changed too (symbolic links are left alone). Only the full-access root and what it holds
// are touched: any other path, or any path while no root is set, is logged and left as it
// is. Failures are ignored.
void SetNamedFullAccess(const wstring& path, bool inherit);
// The one folder (with everything in it) SetNamedFullAccess may change; empty: none.
void SetFullAccessRoot(const wstring& root);

// How a file written through a temporary file came out.
enum class AtomicWrite { Done, CannotCreate, CannotWrite, CannotReplace };

// Writes `path` through a temporary file beside it: `emit` fills the file, which is then
// flushed to disk and renamed over the old one (and the rename made durable). On any
// failure the temporary file is removed and an old file stays as it was.
AtomicWrite WriteFileAtomically(const std::string& path, const std::function<bool(FILE*)>& emit);
bool WriteFileAtomically(const std::string& path, const void* data, size_t size);

// The whole content of a file; false if it cannot be read.
bool ReadWholeFile(const std::string& path, std::string& out);

// gzip a file into another and back, through zlib in blocks of 32768 bytes. The
// destination is written beside itself and renamed into place, so a failure leaves an
// existing destination as it was. True when the whole input went through without error.
bool Compress(const wstring& source, const wstring& destination);
bool Uncompress(const wstring& source, const wstring& destination);

// Appends to `_list` folder + name for each entry of the folder of the pattern whose name
// matches the pattern's last component ("*", "?" and sets; letter case ignored), sorted
// by name. "." and ".." are left out.
void ListFiles(std::vector<wstring>& _list, const wchar* _path_and_name_of_folder);

// Cuts the last component in place. False, with the path unchanged, for a path of at most
// one character or one that ends in a separator; a path without a separator becomes empty.
bool RemoveLastPathPart(wchar* _path);
bool RemoveLastPathPart(wstring& _path);

// Creates the folder with every missing level; true if it exists as a folder afterwards.
bool CreateFolder(const wstring& path);

} // namespace ox::misc::sys
