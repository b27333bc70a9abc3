#pragma once
// The fonts that properties/fonts.xml declares. Each font's metrics come from its
// properties file (XML) or from the precompiled "<file>.bindump" beside it; fonts that
// name the same file share one block. The font's texture is found by its image id through
// a look-up the application provides (the texture manager).
#include "core/Declaration.h"
#include "graphics/Font.h"

#include <functional>
#include <map>
#include <string>

namespace ox::misc {
class CGamePack;
}

namespace ox::graphics {
class CTexture;
}

namespace ox::core {

class CFontManager : public CResourceManager<graphics::CFont, FontDeclaration> {
public:
    // The texture of an image id, or null.
    using TextureLookup = std::function<const graphics::CTexture*(const char* id)>;

    // Files come through `pack`; null means the process-wide game pack.
    explicit CFontManager(misc::CGamePack* pack = nullptr);
    ~CFontManager() override;
    CFontManager(const CFontManager&) = delete;
    CFontManager& operator=(const CFontManager&) = delete;

    // The process-wide manager, made at first use and never destroyed.
    static CFontManager& Instance();

    void SetTextureLookup(TextureLookup lookup) { m_TextureLookup = std::move(lookup); }

    bool Load(const FontDeclaration& declaration, graphics::CFont& item) override;
    // Loads the font again into the existing item.
    bool Reload(const FontDeclaration& declaration, graphics::CFont& item, bool flag) override;

    // Writes every block built from a properties file, whole, to "<file>.bindump" on disk.
    // Returns the number of files written.
    unsigned SaveBindumps() const;

    // Whether a properties file has a block, and whether it was built here (from XML).
    bool HasBlock(const std::string& path) const { return m_Info.count(path) != 0; }
    bool IsOwnedBlock(const std::string& path) const;

private:
    struct Info {
        bool owned = false;
        const void* data = nullptr;
        // A block built from XML, or a copy of a dump that could not be used where it lay.
        graphics::FontBlock block;
        // What the pack handed out for a dump used in place, given back at the end.
        const void* packHandle = nullptr;
    };

    // Reads "<path>.bindump"; false when it is absent or refused.
    bool LoadBindump(const std::string& path, Info& info);

    misc::CGamePack* m_Pack;
    TextureLookup m_TextureLookup;
    std::map<std::string, Info> m_Info;
};

} // namespace ox::core
