#include "core/TexturesAlpha.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Texture.h"
#include "misc/GamePack.h"

#include <cstring>

namespace ox::core {

namespace {

constexpr const char* kChannel = "textures_alpha";
constexpr uint32_t kRevision = 1;

uint16_t ReadU16(const uint8_t* p)
{
    uint16_t value;
    memcpy(&value, p, sizeof(value));
    return value;
}

} // namespace

CTexturesAlpha::CTexturesAlpha(misc::CGamePack* pack) : m_Pack(pack) {}

CTexturesAlpha::~CTexturesAlpha() { Release(); }

void CTexturesAlpha::Release()
{
    if (m_File)
        (m_Pack ? *m_Pack : misc::g_GamePack::Instance()).Close(m_File);
    m_File = nullptr;
    m_Header = nullptr;
    m_Records = nullptr;
    m_Size = 0;
}

bool CTexturesAlpha::Load()
{
    Release();
    misc::CGamePack& pack = m_Pack ? *m_Pack : misc::g_GamePack::Instance();
    unsigned size = 0;
    const void* data = pack.Open(kTexturesAlphaFile, &size);
    if (!data)
        return false;
    if (!LoadFromMemory(data, size, kTexturesAlphaFile)) {
        pack.Close(data);
        return false;
    }
    m_File = data;
    return true;
}

bool CTexturesAlpha::LoadFromMemory(const void* data, size_t size, const char* name)
{
    Release();
    const auto* bytes = static_cast<const uint8_t*>(data);
    if (!bytes || !Check(bytes, size, name))
        return false;
    m_Header = reinterpret_cast<const TexturesAlphaHeader*>(bytes);
    m_Records = reinterpret_cast<const TextureAlphaDesc*>(bytes + sizeof(TexturesAlphaHeader));
    m_Size = size;
    return true;
}

bool CTexturesAlpha::Check(const uint8_t* data, size_t size, const char* name) const
{
    if (reinterpret_cast<uintptr_t>(data) % alignof(TextureAlphaDesc) != 0) {
        OX_LOG(kChannel, diag::LogError, "\"%s\" is not aligned in memory", name);
        return false;
    }
    if (size < sizeof(TexturesAlphaHeader)) {
        OX_LOG(kChannel, diag::LogError, "\"%s\" is too short for its header (%zu bytes)", name, size);
        return false;
    }
    const auto* head = reinterpret_cast<const TexturesAlphaHeader*>(data);
    if (head->magick != g_Magick) {
        OX_ASSERT_A(head->magick == g_Magick);
        OX_LOG(kChannel, diag::LogError,
               "Textures alpha bindump is corrupted or has another version. Current revision: %u, bindump's "
               "revision%u",
               kRevision, head->magick >> 24);
        return false;
    }
    if (sizeof(TexturesAlphaHeader) + uint64_t(head->count) * sizeof(TextureAlphaDesc) > size) {
        OX_LOG(kChannel, diag::LogError, "\"%s\": %u records do not fit in its %zu bytes", name, head->count, size);
        return false;
    }
    const auto* records = reinterpret_cast<const TextureAlphaDesc*>(data + sizeof(TexturesAlphaHeader));
    for (uint32_t i = 0; i < head->count; ++i) {
        const TextureAlphaDesc& record = records[i];
        const misc::StringA88& id = record.id;
        // Ids are compared in place: each must be a well-formed string with its hash set.
        if (id.max_size != misc::StringA88::kCapacity || id.size >= misc::StringA88::kCapacity ||
            id.m_Data[id.size] != 0 || id.hash != misc::CalcHash(id.m_Data, id.size)) {
            OX_LOG(kChannel, diag::LogError, "\"%s\": record %u has a corrupt id", name, i);
            return false;
        }
        if (i > 0 && records[i - 1].id.Compare(id.c_str()) >= 0) {
            OX_LOG(kChannel, diag::LogError, "\"%s\": record %u (\"%s\") is out of order", name, i, id.c_str());
            return false;
        }
        if (!record.uniform && uint64_t(record.offset) + record.size > size) {
            OX_LOG(kChannel, diag::LogError, "\"%s\": the runs of \"%s\" lie outside the file", name, id.c_str());
            return false;
        }
    }
    return true;
}

const TextureAlphaDesc* CTexturesAlpha::Find(const char* id) const
{
    if (!m_Header || !id || strlen(id) >= misc::StringA88::kCapacity)
        return nullptr;
    size_t lo = 0, hi = m_Header->count;
    while (lo < hi) {
        size_t mid = lo + (hi - lo) / 2;
        int order = m_Records[mid].id.Compare(id);
        if (order == 0)
            return &m_Records[mid];
        if (order < 0)
            lo = mid + 1;
        else
            hi = mid;
    }
    return nullptr;
}

bool CTexturesAlpha::IsOpaque(const graphics::CTexture& texture, int x, int y) const
{
    const char* _from = texture.GetData() ? texture.GetData()->id.c_str() : nullptr;
    return IsOpaque(_from, x, y);
}

bool CTexturesAlpha::IsOpaque(const char* _from, int x, int y) const
{
    OX_ASSERT(_from != 0);
    // A texture without a mask, or no masks at all, is a game-data mistake: logged, not solid.
    OX_CHECK_DATA(_from && IsAvailable(), false);
    const TextureAlphaDesc* desc = Find(_from);
    OX_CHECK_DATA(desc, false);
    return IsOpaque(*desc, x, y);
}

bool CTexturesAlpha::IsOpaque(const TextureAlphaDesc& mask, int x, int y) const
{
    const TextureAlphaDesc* desc = &mask;
    if (desc->uniform)
        return desc->uniform_value != 0;
    if (x < 0 || y < 0 || x >= desc->width || y >= desc->height)
        return false;

    const uint64_t index = desc->order == 1 ? uint64_t(desc->width) * y + x : uint64_t(desc->height) * x + y;
    const uint8_t* runs = reinterpret_cast<const uint8_t*>(m_Header) + desc->offset;
    const size_t count = desc->size / 2;
    uint64_t sum = 0;
    for (size_t i = 0; i < count; ++i) {
        uint16_t run = ReadU16(runs + i * 2);
        sum += run & kMaxRunLength;
        if (index < sum)
            return (run & kRunValueBit) != 0;
    }
    return false;
}

} // namespace ox::core
