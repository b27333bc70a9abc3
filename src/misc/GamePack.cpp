#include "misc/GamePack.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/Unicode.h"
#include "misc/sys/Language.h"
#include "misc/sys/MemMap.h"
#include "misc/sys/Path.h"

#include <algorithm>
#include <cstring>
#include <dirent.h>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

namespace ox::misc {

namespace {

constexpr const char* kChannel = "gamepack";

bool StartsWith(const PackEntry& entry, const char* prefix, size_t length)
{
    return strncmp(entry.path.c_str(), prefix, length) == 0;
}

std::string OverlayName(const char* language, const char* path)
{
    return std::string(kLanguagesFolder) + "/" + language + "/" + path;
}

} // namespace

unsigned SearchPrefix(const PackEntry* begin, const PackEntry* end, const char* prefix,
                      const PackEntry** first, const PackEntry** last,
                      CGamePack::EnumCallback callback, void* user)
{
    *first = nullptr;
    *last = nullptr;
    ptrdiff_t n = end - begin;
    if (n <= 0)
        return 0;
    size_t length = strlen(prefix);

    ptrdiff_t lo = 0, hi = n - 1, found = -1;
    if (hi > lo) {
        while (lo <= hi) {
            ptrdiff_t mid = (lo + hi) / 2;
            if (StartsWith(begin[mid], prefix, length)) {
                found = mid;
                break;
            }
            if (strcmp(begin[mid].path.c_str(), prefix) > 0)
                hi = mid - 1;
            else
                lo = mid + 1;
        }
    }
    if (found < 0 && lo >= 0 && lo < n && StartsWith(begin[lo], prefix, length))
        found = lo;
    if (found < 0)
        return 0;

    while (found > 0 && StartsWith(begin[found - 1], prefix, length))
        --found;
    unsigned count = 0;
    ptrdiff_t i = found;
    for (; i < n && StartsWith(begin[i], prefix, length); ++i, ++count)
        if (callback)
            callback(user, begin[i].path.c_str());
    *first = begin + found;
    *last = begin + i;
    return count;
}

CGamePack::CGamePack() : CGamePack(GamePackConfig{}) {}

void CGamePack::SetNames(const GamePackConfig& config)
{
    m_Folder = config.folder;
    if (!m_Folder.empty() && m_Folder.back() != '/')
        m_Folder += '/';
    m_PackName = config.packFile;
}

CGamePack::CGamePack(GamePackConfig config)
{
    SetNames(config);
    std::string packPath = !m_PackName.empty() && m_PackName[0] == '/' ? m_PackName : m_Folder + m_PackName;
    unsigned size = 0;
    m_Data = static_cast<const uint8_t*>(sys::MapFile(packPath.c_str(), &size));
    m_Size = size;
    m_Mapped = m_Data != nullptr;
    if (!m_Data)
        m_PackError = "cannot be mapped (missing, empty or unreadable)";
    Load(config);
}

CGamePack::CGamePack(const void* image, size_t size, GamePackConfig config)
{
    SetNames(config);
    m_Data = static_cast<const uint8_t*>(image);
    m_Size = size;
    if (!m_Data || size == 0) {
        m_Data = nullptr;
        m_Size = 0;
        m_PackError = "no pack image";
    }
    Load(config);
}

CGamePack::~CGamePack()
{
    if (m_Data && m_Mapped)
        sys::UnmapFile(m_Data);
}

void CGamePack::Load(GamePackConfig& config)
{
    if (m_Data && !CheckPack()) {
        if (m_Mapped)
            sys::UnmapFile(m_Data);
        m_Data = nullptr;
        m_Size = 0;
        m_Mapped = false;
    }

    bool asked;
    if (config.language) {
        asked = !config.language->empty() && config.language->size() < sizeof(m_Language);
        if (asked)
            memcpy(m_Language, config.language->c_str(), config.language->size() + 1);
    } else {
        asked = sys::GetCurrentUserPreferredLanguage(m_Language, sizeof(m_Language));
    }
    if (!asked || !m_Language[0]) {
        m_Language[0] = 0;
        OX_LOG(kChannel, diag::LogInfo, "GetCurrentUserPreferredLanguage() returned false");
        return;
    }
    OX_LOG(kChannel, diag::LogInfo, "User preferred language: %s", m_Language);
    m_HasLanguage = true;
    if (m_Data)
        FindOverlay();
}

bool CGamePack::CheckPack()
{
    // A wrong header gives the plain line; a broken table says what is wrong with it.
    auto refuse = [this](const std::string& why) {
        if (why.empty()) {
            OX_LOG(kChannel, diag::LogError, "%s is invalid", m_PackName.c_str());
            m_PackError = "wrong magic or total size";
        } else {
            OX_LOG(kChannel, diag::LogError, "%s is invalid: %s", m_PackName.c_str(), why.c_str());
            m_PackError = why;
        }
        return false;
    };

    if (reinterpret_cast<uintptr_t>(m_Data) % 4 != 0)
        return refuse("the image is not aligned to 4 bytes");
    if (m_Size < sizeof(PackHeader))
        return refuse("");
    const PackHeader& header = Header();
    if (header.magic != kPackMagic || header.totalSize != m_Size)
        return refuse("");

    uint64_t tableEnd = sizeof(PackHeader) + uint64_t(header.count) * sizeof(PackEntry);
    if (tableEnd > m_Size)
        return refuse(Format("the table of %u entries runs past the end of the file", header.count));

    const PackEntry* entries = Entries();
    for (uint32_t i = 0; i < header.count; ++i) {
        const PackEntry& entry = entries[i];
        const char* path = entry.path.c_str();
        // The path must be a well-formed string: a hash of 0 would be computed and
        // stored on first use, and the mapping is read-only.
        if (entry.path.max_size != kPackPathCapacity || entry.path.size == 0 ||
            entry.path.size >= kPackPathCapacity || memchr(path, 0, kPackPathCapacity) != path + entry.path.size)
            return refuse(Format("entry %u: the path is not a valid string", i));
        if (entry.path.hash != CalcHash(path, entry.path.size))
            return refuse(Format("entry %u (%s): the hash does not match the path", i, path));
        if (i > 0 && strcmp(entries[i - 1].path.c_str(), path) >= 0)
            return refuse(Format("entry %u (%s): entries out of order or repeated", i, path));
        if (entry.offset % 4 != 0)
            return refuse(Format("entry %u (%s): the data offset is not a multiple of 4", i, path));
        if (entry.offset < tableEnd + sizeof(uint32_t))
            return refuse(Format("entry %u (%s): the data overlaps the table", i, path));
        // Even an empty file starts inside the mapping, so that its pointer is known as
        // one of the pack's.
        if (entry.offset >= m_Size || uint64_t(entry.offset) + entry.size > m_Size)
            return refuse(Format("entry %u (%s): the data lies past the end of the file", i, path));
    }
    return true;
}

void CGamePack::FindOverlay()
{
    const PackEntry* begin = Entries();
    const PackEntry* end = begin + EntryCount();
    std::string prefix = OverlayName(m_Language, "");
    if (SearchPrefix(begin, end, prefix.c_str(), &m_LanguageBegin, &m_LanguageEnd) > 0)
        return;
    // "pt-BR" without an overlay of its own takes that of "pt"; the cut code stays.
    if (char* dash = strchr(m_Language, '-')) {
        *dash = 0;
        prefix = OverlayName(m_Language, "");
        SearchPrefix(begin, end, prefix.c_str(), &m_LanguageBegin, &m_LanguageEnd);
    }
}

const PackEntry* CGamePack::Entries() const
{
    return HasPack() ? reinterpret_cast<const PackEntry*>(m_Data + sizeof(PackHeader)) : nullptr;
}

bool CGamePack::InsidePack(const void* pointer) const
{
    const auto* p = static_cast<const uint8_t*>(pointer);
    return m_Data && p > m_Data && p < m_Data + m_Size;
}

const PackEntry* CGamePack::Search(const PackEntry* begin, const PackEntry* end, const char* path) const
{
    ptrdiff_t n = end - begin;
    size_t length = strlen(path);
    if (n <= 0 || length + 1 > kPackPathCapacity)
        return nullptr;
    StringA112 key(std::string_view(path, length));
    key.Hash();

    const PackEntry* found = nullptr;
    ptrdiff_t lo = 0, hi = n - 1;
    if (hi > lo) {
        while (lo <= hi) {
            ptrdiff_t mid = (lo + hi) / 2;
            if (key.Equal(begin[mid].path, 1)) {
                found = begin + mid;
                break;
            }
            if (begin[mid].path.Compare(key.c_str()) > 0)
                hi = mid - 1;
            else
                lo = mid + 1;
        }
    }
    if (!found && lo >= 0 && lo < n && key.Equal(begin[lo].path, 1))
        found = begin + lo;
    if (!found)
        return nullptr;

    uint32_t sizeWord;
    memcpy(&sizeWord, m_Data + found->offset - sizeof(uint32_t), sizeof(sizeWord));
    if (sizeWord != found->size) {
        OX_LOG(kChannel, diag::LogError, "%s: the size in front of %s (%u) differs from its entry (%u)",
               m_PackName.c_str(), found->path.c_str(), sizeWord, found->size);
        return nullptr;
    }
    return found;
}

const PackEntry* CGamePack::SearchOverlay(const char* path) const
{
    if (!m_Data || !m_LanguageBegin)
        return nullptr;
    std::string name = OverlayName(m_Language, path);
    if (name.size() + 1 >= kPackPathCapacity)
        return nullptr;
    return Search(m_LanguageBegin, m_LanguageEnd, name.c_str());
}

const PackEntry* CGamePack::SearchPack(const char* path) const
{
    if (!m_Data)
        return nullptr;
    const PackEntry* entry = Search(Entries(), Entries() + EntryCount(), path);
    if (entry)
        OX_ASSERT(((size_t)entry->offset) % 4 == 0);
    return entry;
}

std::string CGamePack::LoosePath(const char* path) const { return sys::NativePath(m_Folder + path); }

std::string CGamePack::LooseOverlayPath(const char* path) const
{
    return sys::NativePath(m_Folder + Format("%s/%s/%s", kLanguagesFolder, m_Language, path));
}

bool CGamePack::Access(const char* path) const
{
    if (!path)
        return false;
    if (SearchOverlay(path) || SearchPack(path))
        return true;
    if (m_HasLanguage && access(LooseOverlayPath(path).c_str(), F_OK) == 0)
        return true;
    return access(LoosePath(path).c_str(), F_OK) == 0;
}

bool CGamePack::IsLooseFile(const char* path) const
{
    if (!path || !*path)
        return false;
    if (m_HasLanguage && access(LooseOverlayPath(path).c_str(), F_OK) == 0)
        return true;
    return access(LoosePath(path).c_str(), F_OK) == 0;
}

const void* CGamePack::Open(const char* path, unsigned* size)
{
    if (size)
        *size = 0;
    if (!path)
        return nullptr;
    const PackEntry* entry = SearchOverlay(path);
    if (!entry)
        entry = SearchPack(path);
    if (entry) {
        if (size)
            *size = entry->size;
        return m_Data + entry->offset;
    }
    if (m_HasLanguage)
        if (const void* loose = sys::MapFile(LooseOverlayPath(path).c_str(), size))
            return loose;
    return sys::MapFile(LoosePath(path).c_str(), size);
}

void CGamePack::Close(const void* pointer)
{
    if (InsidePack(pointer))
        return;
    sys::UnmapFile(pointer);
}

unsigned CGamePack::GetSize(const void* pointer) const
{
    if (InsidePack(pointer)) {
        const auto* p = static_cast<const uint8_t*>(pointer);
        OX_ASSERT(p >= m_Data + sizeof(uint32_t));
        if (p < m_Data + sizeof(uint32_t))
            return 0;
        uint32_t size;
        memcpy(&size, p - sizeof(uint32_t), sizeof(size));
        return size;
    }
    return sys::GetMappedSize(pointer);
}

bool CGamePack::IsLocalized(const char* path) const
{
    if (!m_HasLanguage || !path)
        return false;
    if (SearchOverlay(path))
        return true;
    if (SearchPack(path))
        return false;
    return access(LooseOverlayPath(path).c_str(), F_OK) == 0;
}

unsigned CGamePack::EnumFiles(const char* _prefix, EnumCallback callback, void* user) const
{
    OX_ASSERT(_prefix);
    if (!_prefix)
        return 0;

    if (m_Data) {
        const PackEntry* entries = Entries();
        uint32_t count = EntryCount();
        if (!*_prefix) {
            for (uint32_t i = 0; i < count; ++i)
                if (callback)
                    callback(user, entries[i].path.c_str());
            return count;
        }
        const PackEntry* first;
        const PackEntry* last;
        return SearchPrefix(entries, entries + count, _prefix, &first, &last, callback, user);
    }

    if (!*_prefix)
        return 0;
    std::string prefix = _prefix;
    if (prefix.back() != '/' && prefix.back() != '\\')
        prefix += '/';
    std::string folder = LoosePath(prefix.c_str());
    DIR* dir = opendir(folder.c_str());
    if (!dir)
        return 0;
    std::vector<std::string> names;
    while (const dirent* item = readdir(dir)) {
        struct stat info;
        std::string full = folder + item->d_name;
        if (stat(full.c_str(), &info) == 0 && S_ISREG(info.st_mode))
            names.push_back(item->d_name);
    }
    closedir(dir);
    std::sort(names.begin(), names.end());
    for (const std::string& name : names)
        if (callback)
            callback(user, (prefix + name).c_str());
    return static_cast<unsigned>(names.size());
}

CGamePack& g_GamePack::Instance()
{
    static CGamePack* pack = new CGamePack();
    return *pack;
}

} // namespace ox::misc
