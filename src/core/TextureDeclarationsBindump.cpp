// The texture declarations as the game reads them: the bulk (properties/resources.bindump,
// or a converted document) checked once and then used in place.
#include "core/TextureDeclarations.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/GamePack.h"

#include <cstring>

namespace ox::core {

namespace {

using Loader = CTextureDeclarationsLoader;
constexpr const char* kChannel = Loader::LogChannel;
using graphics::TextureDesc;

// A fixed string from a file: its capacity as declared, its size inside it and its text
// terminated where the size says.
template <size_t N>
bool StringIsSound(const misc::String<char, N>& s)
{
    return s.max_size == N && s.size < N && s.m_Data[s.size] == 0 && memchr(s.m_Data, 0, s.size) == nullptr;
}

} // namespace

CTextureDeclarationsLoader::CTextureDeclarationsLoader(misc::CGamePack* pack) : m_Pack(pack) {}

CTextureDeclarationsLoader::~CTextureDeclarationsLoader() { Release(); }

void CTextureDeclarationsLoader::Release()
{
    if (m_File)
        Pack().Close(m_File);
    m_File = nullptr;
    m_Data = nullptr;
    m_Size = 0;
    m_Owned.clear();
    m_Owned.shrink_to_fit();
}

bool CTextureDeclarationsLoader::Load()
{
    Release();
    misc::CGamePack& pack = Pack();
    unsigned size = 0;
    if (const void* data = pack.Open(kResourcesBindump, &size)) {
        if (!LoadFromMemory(data, size, kResourcesBindump)) {
            pack.Close(data);
            return false;
        }
        m_File = data;
        return true;
    }
    const void* xml = pack.Open(kResourcesXml, &size);
    if (!xml) {
        OX_LOG(kChannel, diag::LogError, "Cannot read texture declarations: neither \"%s\" nor \"%s\" exists",
               kResourcesBindump, kResourcesXml);
        return false;
    }
    bool ok = LoadXml(static_cast<const char*>(xml), size, kResourcesXml);
    pack.Close(xml);
    return ok;
}

bool CTextureDeclarationsLoader::LoadFromMemory(const void* data, size_t size, const char* name)
{
    Release();
    if (!Check(data, size, name))
        return false;
    m_Data = static_cast<const Header*>(data);
    m_Size = size;
    return true;
}

const Loader::Header* CTextureDeclarationsLoader::Data() const
{
    OX_ASSERT(m_Data != 0);
    return m_Data;
}

const Loader::SurfaceRecord* CTextureDeclarationsLoader::Surfaces() const
{
    return m_Data ? reinterpret_cast<const SurfaceRecord*>(m_Data + 1) : nullptr;
}

const Loader::GroupRecord* CTextureDeclarationsLoader::Groups() const
{
    return m_Data ? reinterpret_cast<const GroupRecord*>(Surfaces() + m_Data->surfaces_amount) : nullptr;
}

const Loader::ImageEntry* CTextureDeclarationsLoader::Images() const
{
    return m_Data ? reinterpret_cast<const ImageEntry*>(Groups() + m_Data->groups_amount) : nullptr;
}

const TextureDesc* CTextureDeclarationsLoader::Desc(const ImageEntry& image) const
{
    return reinterpret_cast<const TextureDesc*>(reinterpret_cast<const uint8_t*>(m_Data) + image.desc);
}

uint32_t CTextureDeclarationsLoader::SurfaceIndex(const TextureDesc& desc) const
{
    return static_cast<uint32_t>((desc.surface - sizeof(Header)) / sizeof(SurfaceRecord));
}

const Loader::GroupRecord* CTextureDeclarationsLoader::Group(uint32_t offset) const
{
    if (!m_Data || offset == 0)
        return nullptr;
    return reinterpret_cast<const GroupRecord*>(reinterpret_cast<const uint8_t*>(m_Data) + offset);
}

int CTextureDeclarationsLoader::FindImageIndex(const char* id) const
{
    if (!m_Data || !id || !*id)
        return -1;
    const ImageEntry* images = Images();
    const size_t length = strlen(id);
    if (length >= misc::StringA88::kCapacity)
        return -1;
    // Equal hashes and sizes first, then the bytes; the order comes from the bytes.
    const uint16_t hash = misc::CalcHash(id, length);
    int lo = 0, hi = static_cast<int>(m_Data->images_amount) - 1;
    while (lo <= hi) {
        const int mid = lo + (hi - lo) / 2;
        const misc::StringA88& probe = images[mid].id;
        if (probe.hash == hash && probe.size == length && memcmp(probe.m_Data, id, length) == 0)
            return mid;
        const int order = Loader::CompareIds(probe.m_Data, id);
        if (order == 0)
            return mid;
        if (order < 0)
            lo = mid + 1;
        else
            hi = mid - 1;
    }
    return -1;
}

const Loader::ImageEntry* CTextureDeclarationsLoader::FindImage(const char* id) const
{
    const int index = FindImageIndex(id);
    return index < 0 ? nullptr : Images() + index;
}

bool CTextureDeclarationsLoader::Check(const void* data, size_t size, const char* name)
{
    auto refuse = [name](const char* why) {
        OX_LOG(kChannel, diag::LogError, "Textures bindump \"%s\" is refused: %s", name, why);
        return false;
    };
    if (!data)
        return refuse("no data");
    if (reinterpret_cast<uintptr_t>(data) % 4 != 0)
        return refuse("not aligned in memory");
    if (size < sizeof(Header))
        return refuse("shorter than its header");
    const auto* bytes = static_cast<const uint8_t*>(data);
    const auto* header = static_cast<const Header*>(data);
    if (header->magic != Magic) {
        OX_LOG(kChannel, diag::LogError,
               "Textures bindump is corrupted or has another version. Current revision: %u, bindump's revision%u",
               Revision, header->magic >> 24);
        return false;
    }
    const uint64_t tableEnd = sizeof(Header) + uint64_t(header->surfaces_amount) * sizeof(SurfaceRecord) +
                              uint64_t(header->groups_amount) * sizeof(GroupRecord) +
                              uint64_t(header->images_amount) * sizeof(ImageEntry);
    if (tableEnd > size)
        return refuse("its record counts run past its size");

    const auto* surfaces = reinterpret_cast<const SurfaceRecord*>(header + 1);
    const auto* groups = reinterpret_cast<const GroupRecord*>(surfaces + header->surfaces_amount);
    const auto* images = reinterpret_cast<const ImageEntry*>(groups + header->groups_amount);
    const uint64_t groupsBegin = sizeof(Header) + uint64_t(header->surfaces_amount) * sizeof(SurfaceRecord);
    auto isSurface = [&](uint32_t offset) {
        return offset >= sizeof(Header) && offset < groupsBegin && (offset - sizeof(Header)) % sizeof(SurfaceRecord) == 0;
    };
    auto isGroup = [&](uint32_t offset) {
        const uint64_t end = groupsBegin + uint64_t(header->groups_amount) * sizeof(GroupRecord);
        return offset >= groupsBegin && offset < end && (offset - groupsBegin) % sizeof(GroupRecord) == 0;
    };

    for (uint32_t i = 0; i < header->surfaces_amount; ++i)
        if (!StringIsSound(surfaces[i].path))
            return refuse("a surface path is not a valid string");
    for (uint32_t i = 0; i < header->groups_amount; ++i) {
        if (!StringIsSound(groups[i].id))
            return refuse("a group id is not a valid string");
        if (groups[i].parent != 0 && !isGroup(groups[i].parent))
            return refuse("a group's parent is not a group");
    }
    for (uint32_t i = 0; i < header->images_amount; ++i) {
        const ImageEntry& image = images[i];
        if (!StringIsSound(image.id))
            return refuse("an image id is not a valid string");
        if (image.id.hash != misc::CalcHash(image.id.m_Data, image.id.size))
            return refuse("an image id has a wrong hash");
        if (i > 0 && Loader::CompareIds(images[i - 1].id.m_Data, image.id.m_Data) >= 0)
            return refuse("the image table is not sorted by id");
        if (image.group != 0 && !isGroup(image.group))
            return refuse("an image's group is not a group");
        if (image.desc < tableEnd || image.desc % 4 != 0 || uint64_t(image.desc) + sizeof(TextureDesc) > size)
            return refuse("an image description lies outside the file");
        const auto* desc = reinterpret_cast<const TextureDesc*>(bytes + image.desc);
        if (desc->parts_amount == 0 || uint64_t(image.desc) + desc->ByteSize() > size)
            return refuse("an image's parts lie outside the file");
        if (!isSurface(desc->surface))
            return refuse("an image's surface is not a surface record");
        if (desc->frame_delays_count > TextureDesc::MaximumFrames ||
            desc->frame_map_length > TextureDesc::MaximumFrames)
            return refuse("an image has more than 32 frames");
        for (unsigned f = 0; f < desc->frame_map_length; ++f)
            if (desc->frame_map[f] < 0 || desc->frame_map[f] >= desc->frame_delays_count)
                return refuse("an image's frame map names a frame it does not have");
        if (!StringIsSound(desc->id))
            return refuse("an image description's id is not a valid string");
    }
    return true;
}

misc::CGamePack& CTextureDeclarationsLoader::Pack() const { return m_Pack ? *m_Pack : misc::g_GamePack::Instance(); }

} // namespace ox::core
