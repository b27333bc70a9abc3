#pragma once
// A small flexible-box model. Each widget loaded from a description has a box; between widgets
// a description may put bare boxes (hbox, vbox, spacer) that have no widget. The boxes form a
// tree beside the widget tree: sizes are measured bottom-up, space is shared out top-down, then
// the widgets' offsets are set. Layout runs on demand only, never per frame.
#include "gui/BaseWidget.h"

#include <vector>

namespace ox::gui {

class CLayoutBox {
public:
    enum Pack { PackStart = 0, PackCenter = 1, PackEnd = 2 };
    enum Align { AlignStretch = 0, AlignStart = 1, AlignCenter = 2, AlignEnd = 3 };
    using BoxesT = std::vector<LayoutBoxPtrT>;
    using FloatVector = misc::FloatVector;

    CLayoutBox() = default;
    CLayoutBox(const CLayoutBox&) = delete;
    CLayoutBox& operator=(const CLayoutBox&) = delete;

    // Reads the box's attributes and insets from `node`, then its child elements: box elements
    // become bare child boxes, widget kinds known to the factory become widgets (added to the
    // nearest widget above) whose boxes join this one. `widget` is the box's widget, or null.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates, CBaseWidget* widget);

    // Sizes bottom-up, children first; every box ends at least as large as its content.
    void MeasureTree();
    // Raises the minimum size to (width, height) and grows the box to it.
    void SetMinSize(float width, float height);
    // The size, at least the minimum. A widget box goes through the widget's SetSize (which
    // shares out its children) and keeps what the widget took; a bare box shares out itself.
    void SetBoxSize(float width, float height);
    // Shares the box's room among the children: flexible ones by their shares, and across the
    // main axis each one when the box stretches.
    void DistributeChildren();
    // Places the children from (x, y) in the coordinates of the nearest widget; a widget box
    // that is not the root sets its widget's offset and places its children in its own.
    void ApplyOffsets(float x, float y, bool isRoot);
    // Takes a box out of the tree below this one, wherever it is; false if it isn't there.
    bool RemoveBox(const CLayoutBox* box);
    // What MeasureTree would make of the box, changing nothing.
    FloatVector ComputePreferredSize() const;

    // The size: a widget box's is the widget's.
    FloatVector GetSize() const;
    const misc::FloatInsets& GetInsets() const;
    void SetInsets(const misc::FloatInsets& insets) { m_Insets = insets; }
    CBaseWidget* GetWidget() const { return m_Widget; }
    // The widget is going away: the box stays in its tree as a bare one.
    void DetachWidget() { m_Widget = nullptr; }
    const BoxesT& GetChildren() const { return m_Children; }
    void AddChild(LayoutBoxPtrT box) { m_Children.push_back(std::move(box)); }
    const FloatVector& GetMinSize() const { return m_MinSize; }
    bool IsHorizontal() const { return m_Horizontal; }
    void SetHorizontal(bool horizontal) { m_Horizontal = horizontal; }
    bool IsAbsPos() const { return m_AbsPos; }
    void SetAbsPos(bool absPos) { m_AbsPos = absPos; }
    int GetFlex() const { return m_Flex; }
    void SetFlex(int flex) { m_Flex = flex; }
    Pack GetPack() const { return m_Pack; }
    void SetPack(Pack pack) { m_Pack = pack; }
    Align GetAlign() const { return m_Align; }
    void SetAlign(Align align) { m_Align = align; }

private:
    // The sums over the children that take part in the layout.
    struct Sums {
        float fixed = 0;    // main sizes of the rigid children
        float flexible = 0; // the main room the flexible ones need to keep their sizes at their shares
        float maxCross = 0;
        int flexSum = 0;
        int count = 0;
    };
    template <class SizeOf>
    Sums Sum(const SizeOf& sizeOf) const;
    // The box's size for content with these sums: insets added, at least the widget's preferred size.
    FloatVector ContentSize(const Sums& sums) const;
    // `owner` is the nearest widget at or above this box: the parent of the widgets below it.
    void LoadFrom(const core::CSettingsGroup& node, const core::CSettingsGroup& templates, CBaseWidget* widget,
                  CBaseWidget* owner);
    void LoadAttributes(const core::CSettingsGroup& node);
    void LoadChildren(const core::CSettingsGroup& node, const core::CSettingsGroup& templates, CBaseWidget* owner);
    float Main(const FloatVector& v) const { return m_Horizontal ? v.X : v.Y; }
    float Cross(const FloatVector& v) const { return m_Horizontal ? v.Y : v.X; }
    FloatVector FromAxes(float main, float cross) const
    {
        return m_Horizontal ? FloatVector(main, cross) : FloatVector(cross, main);
    }

    CBaseWidget* m_Widget = nullptr;
    BoxesT m_Children;
    FloatVector m_Size;
    FloatVector m_MinSize;
    bool m_Horizontal = true;
    bool m_AbsPos = false;
    Pack m_Pack = PackStart;
    Align m_Align = AlignStretch;
    int m_Flex = 0;
    misc::FloatInsets m_Insets;
};

} // namespace ox::gui
