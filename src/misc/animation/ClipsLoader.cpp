#include "misc/animation/ClipsLoader.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "misc/GamePack.h"
#include "misc/sys/Path.h"

#include <cstring>
#include <strings.h>

namespace ox::misc::anim {

namespace {

constexpr const char* kChannel = "anim";

CGamePack& PackOf(CGamePack* pack) { return pack ? *pack : g_GamePack::Instance(); }

bool HashIsRight(const StringA88& s) { return s.hash == CalcHash(s.m_Data, s.size); }

// The strings an object of a known type holds beyond its base.
bool ExtensionStringsValid(const ClipObjectBase& object)
{
    switch (object.type) {
    case ImageType:
        return IsStoredStringValid(static_cast<const ImageExtension*>(object.Extension())->image);
    case ClipType:
        return IsStoredStringValid(static_cast<const ClipViewExtension*>(object.Extension())->clip);
    case ParticleType:
        return IsStoredStringValid(static_cast<const ParticleExtension*>(object.Extension())->system);
    case TextType: {
        const auto* text = static_cast<const TextExtension*>(object.Extension());
        return IsStoredStringValid(text->font) && IsStoredStringValid(text->background) &&
               IsStoredStringValid(text->key);
    }
    default:
        return true;
    }
}

// One object that lies in `room` bytes: its size, counts and strings.
const char* CheckObject(const ClipObjectBase& object, size_t room)
{
    if (object.size % 4 != 0 || object.size < sizeof(ClipObjectBase) || object.size > room)
        return "an object's size runs past the clip";
    if (object.type == PathType && object.size < sizeof(ClipObjectBase) + sizeof(PathExtension))
        return "a path object is shorter than its extension";
    if (object.NeededSize() > object.size)
        return "an object's extension, keys or sounds run past its size";
    if (!IsStoredStringValid(object.id) || !IsStoredStringValid(object.path) || !ExtensionStringsValid(object))
        return "an object holds a string that is not valid";
    const SoundPoint* sounds = object.SoundPoints();
    for (unsigned i = 0; i < object.soundpointsnum; ++i)
        if (!IsStoredStringValid(sounds[i].id))
            return "a sound point's id is not a valid string";
    return nullptr;
}

} // namespace

bool CheckClipRecord(const ClipRecord* clip, size_t size, std::string& why)
{
    if (size < sizeof(ClipRecord) + 4) {
        why = "shorter than a clip record";
        return false;
    }
    if (clip->size < sizeof(ClipRecord) + 4 || clip->size >= kMaxClipSize || clip->size % 4 != 0) {
        why = "its size " + std::to_string(clip->size) + " is not a clip's";
        return false;
    }
    if (clip->size > size) {
        why = "its size runs past the data";
        return false;
    }
    if (!IsStoredStringValid(clip->id) || !HashIsRight(clip->id)) {
        why = "its id is not a valid string";
        return false;
    }
    const auto* bytes = reinterpret_cast<const uint8_t*>(clip);
    // Each object must leave room for the end mark behind it.
    for (size_t at = sizeof(ClipRecord); at + 4 <= clip->size;) {
        const auto* object = reinterpret_cast<const ClipObjectBase*>(bytes + at);
        if (object->size == 0)
            return true;
        if (const char* problem = CheckObject(*object, clip->size - at - 4)) {
            why = problem;
            if (clip->size - at >= sizeof(ClipObjectBase) && IsStoredStringValid(object->id))
                why += std::string(" (object '") + object->id.c_str() + "')";
            return false;
        }
        at += object->size;
    }
    why = "it has no end mark";
    return false;
}

// The bulk ------------------------------------------------------------------------------

std::vector<uint32_t> BuildClipsBulk(const ClipRecords& clips)
{
    size_t words = (sizeof(ClipsHeader) + clips.size() * sizeof(ClipTableEntry)) / 4;
    for (const auto& [id, record] : clips)
        words += record.size();
    std::vector<uint32_t> bulk(words, 0);
    auto* bytes = reinterpret_cast<uint8_t*>(bulk.data());
    const ClipsHeader header {kClipsMagic, static_cast<uint32_t>(clips.size())};
    memcpy(bytes, &header, sizeof header);
    // The map's order is byte order of the ids: the table is sorted as it is written.
    size_t entryAt = sizeof(ClipsHeader);
    size_t clipAt = entryAt + clips.size() * sizeof(ClipTableEntry);
    for (const auto& [id, record] : clips) {
        OX_ASSERT(clipAt % 4 == 0);
        ClipTableEntry entry;
        entry.id = std::string_view(id);
        entry.id.Hash();
        entry.offset = static_cast<uint32_t>(clipAt);
        memcpy(bytes + entryAt, &entry, sizeof entry);
        if (!record.empty())
            memcpy(bytes + clipAt, record.data(), record.size() * 4);
        entryAt += sizeof(ClipTableEntry);
        clipAt += record.size() * 4;
    }
    return bulk;
}

// The loader ----------------------------------------------------------------------------

CClipsLoader::CClipsLoader(CGamePack* pack) : m_Pack(pack) {}

CClipsLoader::~CClipsLoader() { Release(); }

CClipsLoader& CClipsLoader::Instance()
{
    static auto* loader = new CClipsLoader();
    return *loader;
}

void CClipsLoader::Release()
{
    if (m_File)
        PackOf(m_Pack).Close(m_File);
    m_File = nullptr;
    m_Data = nullptr;
    m_Size = 0;
    m_Owned.clear();
    m_Owned.shrink_to_fit();
    m_Usable.clear();
    m_BuiltFromXml = false;
}

uint32_t CClipsLoader::Count() const
{
    return m_Data ? reinterpret_cast<const ClipsHeader*>(m_Data)->count : 0;
}

const ClipTableEntry* CClipsLoader::Table() const
{
    return m_Data ? reinterpret_cast<const ClipTableEntry*>(m_Data + sizeof(ClipsHeader)) : nullptr;
}

bool CClipsLoader::Load()
{
    Release();
    CGamePack& pack = PackOf(m_Pack);
    unsigned size = 0;
    if (const void* data = pack.Open(kClipsBindump, &size)) {
        uint32_t magic = 0;
        if (size >= 4)
            memcpy(&magic, data, 4);
        if (magic != kClipsMagic) {
            diag::message::ShowFormat("Error",
                                      "'%s' has wrong format version or is corrupted.\nSupported format: %i, "
                                      "format in bindump: %i",
                                      kClipsBindump, static_cast<int>(kClipsRevision), static_cast<int>(magic >> 24));
            pack.Close(data);
        } else if (reinterpret_cast<uintptr_t>(data) % 4 == 0) {
            if (LoadFromMemory(data, size, kClipsBindump))
                m_File = data;
            else
                pack.Close(data);
        } else {
            // A dump that does not lie on a 4-byte boundary is used from an aligned copy.
            std::vector<uint32_t> copy((size + 3) / 4, 0);
            memcpy(copy.data(), data, size);
            pack.Close(data);
            if (LoadFromMemory(copy.data(), size, kClipsBindump))
                m_Owned = std::move(copy);
        }
        OX_LOG(kChannel, diag::LogInfo, "Clips loaded");
        return true;
    }
    const bool loaded = LoadXml();
    OX_LOG(kChannel, diag::LogInfo, "Clips loaded");
    return loaded;
}

bool CClipsLoader::LoadXml()
{
    CGamePack& pack = PackOf(m_Pack);
    ClipRecords clips;
    unsigned size = 0;
    if (const void* xml = pack.Open(kClipsXml, &size)) {
        ConvertClipsXml(static_cast<const char*>(xml), size, kClipsXml, clips);
        pack.Close(xml);
        return LoadRecords(clips);
    }
    std::vector<std::string> files;
    pack.EnumFiles(kClipsFolder, [](void* user, const char* path) {
        const size_t length = strlen(path);
        if (length > 4 && strcasecmp(path + length - 4, ".xml") == 0 && strcasecmp(path, kClipGroupsXml) != 0)
            static_cast<std::vector<std::string>*>(user)->push_back(path);
    }, &files);
    OX_LOG(kChannel, diag::LogTrace, "Found %i clips", static_cast<int>(files.size()));
    for (const std::string& file : files) {
        const void* xml = pack.Open(file.c_str(), &size);
        if (xml && ConvertClipsXml(static_cast<const char*>(xml), size, file.c_str(), clips))
            OX_LOG(kChannel, diag::LogTrace, "Loaded clip: '%s'", file.c_str());
        else
            OX_LOG(kChannel, diag::LogError, "Can't load clip: '%s'", file.c_str());
        if (xml)
            pack.Close(xml);
    }
    if (files.empty())
        OX_LOG(kChannel, diag::LogWarning, "No clips: neither '%s' nor '%s' nor '%s*.xml'", kClipsBindump, kClipsXml,
               kClipsFolder);
    return LoadRecords(clips);
}

bool CClipsLoader::LoadRecords(const ClipRecords& clips)
{
    Release();
    std::vector<uint32_t> bulk = BuildClipsBulk(clips);
    const size_t size = bulk.size() * 4;
    if (!Check(reinterpret_cast<const uint8_t*>(bulk.data()), size, "clips from XML"))
        return false;
    m_Owned = std::move(bulk);
    m_Data = reinterpret_cast<const uint8_t*>(m_Owned.data());
    m_Size = size;
    m_BuiltFromXml = true;
    return true;
}

bool CClipsLoader::LoadFromMemory(const void* data, size_t size, const char* name)
{
    Release();
    if (!Check(static_cast<const uint8_t*>(data), size, name))
        return false;
    m_Data = static_cast<const uint8_t*>(data);
    m_Size = size;
    return true;
}

bool CClipsLoader::Check(const uint8_t* data, size_t size, const char* name)
{
    auto refuse = [name](const char* why) {
        OX_LOG(kChannel, diag::LogError, "Clips bindump '%s' is refused: %s", name, why);
        return false;
    };
    if (!data || reinterpret_cast<uintptr_t>(data) % 4 != 0)
        return refuse("no data, or not aligned to 4 bytes");
    if (size < sizeof(ClipsHeader))
        return refuse("shorter than its header");
    const auto* header = reinterpret_cast<const ClipsHeader*>(data);
    if (header->magic != kClipsMagic)
        return refuse("another format");
    const uint64_t tableEnd = sizeof(ClipsHeader) + uint64_t(header->count) * sizeof(ClipTableEntry);
    if (tableEnd > size)
        return refuse("its table runs past its size");
    const auto* table = reinterpret_cast<const ClipTableEntry*>(data + sizeof(ClipsHeader));
    for (uint32_t i = 0; i < header->count; ++i) {
        if (!IsStoredStringValid(table[i].id) || !HashIsRight(table[i].id))
            return refuse("a table id is not a valid string");
        if (i > 0 && strcmp(table[i - 1].id.c_str(), table[i].id.c_str()) >= 0)
            return refuse("the table is not sorted by id");
    }
    m_Usable.assign(header->count, false);
    for (uint32_t i = 0; i < header->count; ++i) {
        const ClipTableEntry& entry = table[i];
        std::string why;
        if (entry.offset % 4 != 0 || entry.offset < tableEnd || entry.offset >= size)
            why = "its offset lies outside the clip records";
        else if (CheckClipRecord(reinterpret_cast<const ClipRecord*>(data + entry.offset), size - entry.offset, why) &&
                 strcmp(reinterpret_cast<const ClipRecord*>(data + entry.offset)->id.c_str(), entry.id.c_str()) != 0)
            why = "its record has another id";
        if (why.empty())
            m_Usable[i] = true;
        else
            OX_LOG(kChannel, diag::LogError, "%s: clip '%s' is left out: %s", name, entry.id.c_str(), why.c_str());
    }
    return true;
}

const ClipRecord* CClipsLoader::FindClip(const char* id) const
{
    if (!m_Data || !id)
        return nullptr;
    const ClipTableEntry* table = Table();
    int lo = 0, hi = static_cast<int>(Count()) - 1;
    while (lo <= hi) {
        const int mid = lo + (hi - lo) / 2;
        const int order = strcmp(table[mid].id.c_str(), id);
        if (order == 0) {
            if (!IsUsable(mid))
                return nullptr;
            const auto* clip = reinterpret_cast<const ClipRecord*>(m_Data + table[mid].offset);
            OX_ASSERT((size_t)clip % 4 == 0);
            return clip;
        }
        if (order < 0)
            lo = mid + 1;
        else
            hi = mid - 1;
    }
    return nullptr;
}

bool CClipsLoader::SaveBindump() const
{
    if (!m_BuiltFromXml)
        return false;
    const std::string path = sys::NativePath(kClipsBindump);
    if (sys::WriteFileAtomically(path, m_Data, m_Size))
        return true;
    OX_LOG(kChannel, diag::LogError, "cannot write '%s'", path.c_str());
    return false;
}

} // namespace ox::misc::anim
