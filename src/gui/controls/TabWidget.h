#pragma once
// A row of tab buttons over panels of which one shows. Each `tab` element of the description
// gives a button (the element's own attributes: its button template and `caption`) and a
// panel (the element's child widgets, inside the template's `tab_insets`). The tabs stand
// along the top, or down the left side with `alignment_left`; a frame image lies behind the
// panels, overlapping the tabs by `tab_offset_bottom`. Pressing a tab shows its panel and
// tells the parent "panel_selected".
#include "gui/Widget.h"

#include <vector>

namespace ox::gui {

class CButtonWidget;
class CImageWidget;

class CTabWidget : public CWidget {
public:
    struct Panel {
        wstring caption;
        boost::intrusive_ptr<CButtonWidget> button;
        WidgetPtrT content;
    };

    CTabWidget();
    ~CTabWidget() override;

    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    bool ReadsChildElement(std::string_view element) const override { return element == "tabs"; }
    // The frame and the panels take the room below (or beside) the tab strip.
    void SetSize(float width, float height) override;
    // The strip and the largest panel; (0, 0) without tabs.
    FloatVector GetPreferredSize() const override;
    // A press of a tab button selects its panel; other actions go on up.
    void OnChildAction(const std::string& action, CWidget* sender) override;

    int EnumPanels() const { return static_cast<int>(m_Panels.size()); }
    // Shows panel `index` (nothing out of range or for the present one) and tells the parent.
    void SelectPanel(int index);
    int GetSelectedPanel() const { return m_SelectedPanel; }
    // The panel of a tab by index or by caption; null if there is none.
    CWidget* GetPanelContent(int index) const;
    CWidget* GetPanelContent(const wstring& caption) const;
    const std::vector<Panel>& GetPanels() const { return m_Panels; }

    // Tells the parent "panel_selected".
    virtual void OnPanelSelected();

private:
    // The button layer of tab `index` while it isn't selected: the first tab lies on top.
    uint32_t ButtonLayer(size_t index) const;
    // The thickness of the tab strip across the tabs, and its length along them.
    float StripThickness() const;
    float StripLength() const;
    // The size every panel takes in a widget of this size.
    FloatVector PanelSize(const FloatVector& size) const;
    // Where the frame begins across the strip.
    float FrameStart() const;

    std::vector<Panel> m_Panels;
    boost::intrusive_ptr<CImageWidget> m_BackImage;
    int m_SelectedPanel = -1;
    float m_TabOffsetLeft = 0;
    float m_TabOffsetRight = 0;
    float m_TabOffsetBottom = 0;
    bool m_AlignmentLeft = false;
};

} // namespace ox::gui
