#pragma once
// A widget inside another: a parent link, a layer among its siblings, anchors that say how it
// follows its parent's size, the events it asks for in the broadcast pass, and focus.
#include "gui/BaseWidget.h"

namespace ox::gui {

class CWidget : public CBaseWidget {
public:
    CWidget() : CWidget({}, LayerTop, 0) {}
    CWidget(std::string_view id, uint32_t layer, uint32_t broadcastMask);

    // The parent's absolute position plus the offset; the offset alone without a parent.
    FloatVector GetAbsPos(bool toScreen) const override;
    // Focus and actions go up to the parent.
    void SetChildFocused(CWidget* child) override;
    void OnChildAction(const std::string& action, CWidget* sender) override;
    // The base's reading, then `layer`.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;

    virtual void SetParentWidget(CBaseWidget* parent) { m_ParentWidget = parent; }
    virtual void ClearParentWidget() { m_ParentWidget = nullptr; }
    virtual void SetFocused(bool focused) { m_Focused = focused; }
    // Follows a change of the parent's size from (oldWidth, oldHeight) by the anchors: both
    // anchors of an axis keep both margins, the far one alone keeps the far margin, the near
    // one alone keeps the place, none scales place and size with the parent.
    virtual void OnParentSizeChanged(float oldWidth, float oldHeight);

    CBaseWidget* GetParentWidget() const { return m_ParentWidget; }
    // Stores the layer; the parent re-sorts at the end of its next update.
    void SetLayer(uint32_t layer);
    uint32_t GetLayer() const { return m_Layer; }
    uint32_t GetAnchors() const { return m_Anchors; }
    void SetAnchors(uint32_t anchors) { m_Anchors = anchors; }
    uint32_t GetBroadcastMask() const { return m_BroadcastMask; }
    void SetBroadcastMask(uint32_t mask);
    // This widget's mask and those of all below it; kept until a mask or a child changes.
    uint32_t GetChildrenBroadcastMask() const;
    // Forgets the kept masks here and above.
    void OnChildrenMaskChanged() override;
    bool IsFocused() const { return m_Focused; }
    // Moves this widget directly in front of a sibling.
    void LayInFront(const CWidget& other);

private:
    CBaseWidget* m_ParentWidget = nullptr;
    uint32_t m_Layer;
    uint32_t m_BroadcastMask;
    mutable uint32_t m_ChildrenMask = 0;
    mutable bool m_ChildrenMaskKnown = false;
    uint32_t m_Anchors = AnchorLeft | AnchorTop;
    bool m_Focused = false;
};

} // namespace ox::gui
