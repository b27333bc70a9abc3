#pragma once
// What the control tests share: declared textures and a font the controls find by id, the
// sounds they play, a window that notes the actions its controls report, and a recording
// renderer to draw into.
#include "graphics/Font.h"
#include "graphics/Image.h"
#include "graphics/Renderer.h"
#include "graphics/TextRender.h"
#include "graphics/Texture.h"
#include "gui/GuiServices.h"
#include "gui/GuiTestSupport.h"
#include "gui/WidgetFactory.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <cstring>
#include <tuple>
#include <map>
#include <memory>

namespace oxtest {

// Every glyph advances 10 + 1 and stands 20 high; the blank advances 5 + 1.
inline const char* kMonoFontXml = R"(<?xml version="1.0"?>
<Font Padding="0 0 0 0" Space="5" PixHeight="20" Baseline="6" SymbolGap="1" LineGap="0">
  <Char Code="a" Width="10" Rect="0 0 10 20"/>
  <Char Code="b" Width="10" Rect="10 0 20 20"/>
  <Char Code="c" Width="10" Rect="20 0 30 20"/>
</Font>)";

// Notes "action sender-id" for each action that reaches it, then handles it as a window does.
struct ActionWindow : ox::gui::CWindow {
    std::vector<std::string> actions;
    void OnChildAction(const std::string& action, ox::gui::CWidget* sender) override
    {
        actions.push_back(action + " " + (sender ? sender->GetId() : std::string("?")));
        CWindow::OnChildAction(action, sender);
    }
    std::vector<std::string> Take() { return std::exchange(actions, {}); }
};

struct ControlFixture : ::testing::Test {
    LogCapture log;
    RecordingBackend* backend = nullptr;
    std::unique_ptr<ox::graphics::CRenderer> renderer;
    std::map<std::string, std::pair<std::unique_ptr<ox::graphics::CSurface>, std::unique_ptr<ox::graphics::CTexture>>>
        textures;
    ox::graphics::FontBlock block;
    ox::graphics::CFont font;
    std::vector<std::string> sounds;

    void SetUp() override
    {
        renderer = MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
        ASSERT_TRUE(renderer->BeginScene());
        // A button strip of four 16 x 16 states, a 16 x 16 box, an 8 x 8 tick, a bar frame.
        const std::tuple<const char*, int, int> kTextures[] = {{"strip", 64, 16}, {"box", 16, 16},   {"tick", 8, 8},
                                                               {"frame", 100, 10}, {"bar", 100, 10}, {"glyphs", 32, 32},
                                                               {"tip_back", 4, 4}};
        for (auto [id, w, h] : kTextures) {
            auto surface = std::make_unique<ox::graphics::CSurface>(w, h);
            auto texture = std::make_unique<ox::graphics::CTexture>(surface.get());
            textures[id] = {std::move(surface), std::move(texture)};
        }
        ox::graphics::CImage::SetTextureLookup([this](const char* id) -> const ox::graphics::CTexture* {
            auto found = textures.find(id);
            return found == textures.end() ? nullptr : found->second.second.get();
        });
        ASSERT_TRUE(ox::graphics::BuildFontBlock(kMonoFontXml, strlen(kMonoFontXml), "mono", "mono.xml",
                                                 textures["glyphs"].second.get(), block));
        font.Attach(block.data());
        font.Texture = textures["glyphs"].second.get();
        ox::gui::GuiServices& services = ox::gui::GetGuiServices();
        services.findFont = [this](const char* id) { return std::string(id) == "mono" ? &font : nullptr; };
        services.playSound = [this](const std::string& id) { sounds.push_back(id); };
        services.isSound = [](const std::string& id) {
            for (const char* known : {"press", "over", "denied", "check", "on", "off"})
                if (id == known)
                    return true;
            return false;
        };
        ox::gui::RegisterFrameworkWidgets(ox::gui::GetWidgetFactory());
    }
    void TearDown() override
    {
        ox::gui::GuiServices& services = ox::gui::GetGuiServices();
        services.findFont = nullptr;
        services.playSound = nullptr;
        services.isSound = nullptr;
        ox::graphics::CImage::SetTextureLookup(nullptr);
    }
    std::vector<RecordingBackend::Draw> Draws()
    {
        renderer->Flush();
        return std::exchange(backend->draws, {});
    }
    std::vector<std::string> TakeSounds() { return std::exchange(sounds, {}); }
};

} // namespace oxtest
