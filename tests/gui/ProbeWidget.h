#pragma once
// A widget for GUI tests: notes what happens to it in a journal shared by all probes ("update
// a", "draw b", "down c 3,4 b"), draws a filled quad of its size through the renderer, answers
// mouse events as told and reports a preferred size as told.
#include "core/Settings.h"
#include "graphics/Renderer.h"
#include "gui/Widget.h"
#include "gui/WidgetFactory.h"

#include <functional>
#include <string>
#include <vector>

namespace oxtest {

struct ProbeWidget : ox::gui::CWidget {
    using IntVector = ox::misc::IntVector;

    static std::vector<std::string>& Journal()
    {
        static std::vector<std::string> journal;
        return journal;
    }
    // Registers the kind "probe_widget" with the factory.
    static void Register() { ox::gui::GetWidgetFactory().RegisterWidget<ProbeWidget>("probe_widget"); }

    ProbeWidget() = default;
    ProbeWidget(const char* id, uint32_t layer = ox::gui::LayerTop, uint32_t mask = 0) : CWidget(id, layer, mask) {}

    FloatVector preferred;
    bool handles = true;
    std::function<void()> onUpdate;

    void Note(const std::string& what) { Journal().push_back(what + " " + GetId()); }
    FloatVector GetPreferredSize() const override { return preferred; }
    void DoUpdate() override
    {
        Note("update");
        if (onUpdate)
            onUpdate();
    }
    void DoDraw(ox::graphics::CRenderer& renderer) override
    {
        Note("draw");
        renderer.RenderFilledPoly4(ox::misc::RectToPoly4({0, 0, GetSize().X, GetSize().Y}));
        CWidget::DoDraw(renderer);
    }
    bool OnMouseDown(const IntVector& p, ox::gui::MouseButtons button, int keys, bool broadcast) override
    {
        Note("down");
        Journal().back() += " " + std::to_string(p.X) + "," + std::to_string(p.Y) + (broadcast ? " b" : "");
        return CWidget::OnMouseDown(p, button, keys, broadcast) || (handles && !broadcast);
    }
    bool OnKeyDown(int key, int keys, int raw, bool broadcast) override
    {
        Note("key");
        return CWidget::OnKeyDown(key, keys, raw, broadcast);
    }
};

// Settings read from XML elements (the head is added); Root() is the first element,
// Templates() the GUITemplates element.
struct XmlDescription {
    ox::core::CSettings settings;
    explicit XmlDescription(const std::string& xml)
    {
        const std::string document = "<?xml version=\"1.0\"?>\n" + xml;
        settings.LoadXmlFromMemory(document.data(), document.size(), "test.xml");
    }
    const ox::core::CSettingsGroup& Root() const { return settings.GetFirstChild(); }
    const ox::core::CSettingsGroup& Templates() const { return settings.GetChild("GUITemplates"); }
};

} // namespace oxtest
