#include "core/FontManager.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "graphics/Texture.h"
#include "misc/GamePack.h"
#include "misc/sys/Path.h"

#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstring>

namespace ox::core {

CFontManager::CFontManager(misc::CGamePack* pack) : m_Pack(pack ? pack : &misc::g_GamePack::Instance()) {}

CFontManager::~CFontManager()
{
    for (auto& [path, info] : m_Info)
        if (info.packHandle)
            m_Pack->Close(info.packHandle);
}

CFontManager& CFontManager::Instance()
{
    static CFontManager* manager = new CFontManager();
    return *manager;
}

bool CFontManager::IsOwnedBlock(const std::string& path) const
{
    auto it = m_Info.find(path);
    return it != m_Info.end() && it->second.owned;
}

bool CFontManager::LoadBindump(const std::string& path, Info& info)
{
    const std::string dump = path + ".bindump";
    // A loose properties file on disk is newer work than any dump: it wins.
    if (!m_Pack->Access(dump.c_str()) || access(misc::sys::NativePath(path).c_str(), F_OK) == 0)
        return false;
    unsigned size = 0;
    const void* data = m_Pack->Open(dump.c_str(), &size);
    if (!data)
        return false;
    std::string why;
    if (!graphics::CheckFontBlock(data, size, &why)) {
        OX_LOG("font", diag::LogError, "%s: %s", dump.c_str(), why.c_str());
        diag::message::ShowFormat("Error", "'%s' has wrong format version or is corrupted.", dump.c_str());
        m_Pack->Close(data);
        return false;
    }
    info.owned = false;
    if (reinterpret_cast<uintptr_t>(data) % alignof(graphics::FontChar) == 0) {
        info.data = data;
        info.packHandle = data;
    } else {
        info.block.assign(size / 4, 0);
        std::memcpy(info.block.data(), data, size);
        info.data = info.block.data();
        m_Pack->Close(data);
    }
    return true;
}

bool CFontManager::Load(const FontDeclaration& declaration, graphics::CFont& item)
{
    item.id = declaration.m_Id->view();
    item.Color = declaration.color;
    const char* image = declaration.image->c_str();
    item.Texture = m_TextureLookup ? m_TextureLookup(image) : nullptr;
    if (!item.Texture) {
        OX_LOG("font", diag::LogError, "Cannot find '%s' font's texture '%s'", item.id.c_str(), image);
        return false;
    }

    const std::string& path = declaration.file;
    auto found = m_Info.find(path);
    if (found == m_Info.end()) {
        Info info;
        if (!LoadBindump(path, info)) {
            unsigned size = 0;
            const void* data = m_Pack->Open(path.c_str(), &size);
            if (!data) {
                OX_LOG("font", diag::LogError, "Cannot find '%s' font's properties file '%s'", item.id.c_str(),
                       path.c_str());
                return false;
            }
            const bool built = graphics::BuildFontBlock(static_cast<const char*>(data), size, item.id.c_str(),
                                                        path.c_str(), item.Texture, info.block);
            m_Pack->Close(data);
            if (!built)
                return false;
            info.owned = true;
            info.data = info.block.data();
        }
        found = m_Info.emplace(path, std::move(info)).first;
    }
    const Info& info = found->second;
    OX_ASSERT(info.data);
    if (!info.data)
        return false;
    item.Attach(info.data);
    return true;
}

bool CFontManager::Reload(const FontDeclaration& declaration, graphics::CFont& item, bool /*flag*/)
{
    Load(declaration, item);
    return true;
}

unsigned CFontManager::SaveBindumps() const
{
    unsigned written = 0;
    for (const auto& [path, info] : m_Info) {
        if (!info.owned)
            continue;
        const std::string dump = misc::sys::NativePath(path + ".bindump");
        if (misc::sys::WriteFileAtomically(dump, info.block.data(), info.block.size() * sizeof(uint32_t)))
            ++written;
        else
            OX_LOG("font", diag::LogError, "cannot write '%s'", dump.c_str());
    }
    return written;
}

} // namespace ox::core
