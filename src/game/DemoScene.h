#pragma once
// What the game draws until widgets and scenes exist: a cleared canvas and a few
// primitives of every kind the renderer offers, moving with the main timer.
#include "graphics/Image.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "misc/animation/Clip.h"
#include "gui/Widget.h"
#include "quest/Level.h"
#include "quest/SceneGroup.h"

#include <memory>
#include <vector>

namespace k17 {

// A small quest scene built in code, in a frame of its own: a disc with holes over a stone,
// a turned sprite sheet, a lamp group whose two states take turns, the orbit clip tested by
// its pixels, and an area. A probe circling over it outlines the object a click there would
// reach (green), or shows red where the click would fall through to nothing.
class CDemoQuestScene {
public:
    // Once textures and clips are declared.
    void Build();
    void Update(unsigned timeMs);
    void Draw(ox::graphics::CRenderer& renderer);

private:
    qe::LevelPtrT m_Level;
    qe::ScenePtrT m_Scene;
    qe::SceneGroupPtrT m_Lamp;
    ox::misc::FloatVector m_Probe;
    const qe::CBaseSceneObject* m_Hit = nullptr;
};

class CDemoScene : public ox::graphics::IDeviceResourceOwner {
public:
    explicit CDemoScene(ox::graphics::CRenderer& renderer);
    ~CDemoScene() override;

    void Draw(ox::graphics::CRenderer& renderer, unsigned timeMs);
    void ReleaseDeviceResources(bool forReset) override;
    // Looks up the game's declared textures (once they are loaded) for the shelf of images.
    void TakeDeclaredTextures();
    // Starts the authored clip, once clips find their textures and fonts.
    void StartClip();
    // Builds the panel of boxes that `gui` describes (element id "demo_panel") and lays it out.
    void LoadPanel(const ox::core::CSettingsGroup& gui, const ox::core::CSettingsGroup& templates);
    // Once per frame: the clip's time lines, and the panel whose width breathes, so the boxes
    // share out the room again.
    void Update(unsigned timeMs);

private:
    // Text in the demo's fonts, when they are loaded.
    void DrawText(ox::graphics::CRenderer& renderer, float timeSeconds);

    ox::graphics::CRenderer& m_Renderer;
    std::vector<uint32_t> m_Pixels;
    std::unique_ptr<ox::graphics::CSurface> m_Surface;
    std::unique_ptr<ox::graphics::CTexture> m_Texture;
    // Declared textures: an animated sprite sheet, a disc with holes, a container image and
    // a framed tile drawn as a nine-part box.
    ox::graphics::CImage m_Spinner;
    ox::graphics::CImage m_Disc;
    ox::graphics::CImage m_Stone;
    ox::graphics::CImage m_Frame;
    // The authored clip demo_show (properties/clips.xml).
    ox::misc::anim::CClip m_Clip;
    ox::gui::WidgetPtrT m_Panel;
    float m_PanelWidth = 0;
    CDemoQuestScene m_Quest;
};

} // namespace k17
