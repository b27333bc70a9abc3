#pragma once
// The root of every widget tree: the child list (front first), flags, geometry, colour,
// insets, effects and the layout box, and the three walks every frame makes: update, draw
// and input. Widgets are shared through intrusive pointers; a parent holds its children,
// a child's link to its parent is a plain pointer.
#include "core/Settings.h"
#include "core/SettingsValue.h"
#include "graphics/Color.h"
#include "gui/Effect.h"
#include "misc/Insets.h"
#include "misc/Matrix.h"
#include "misc/Poly.h"
#include "misc/Vector.h"
#include "misc/WideChar.h"
#include "misc/ptr.h"

#include <boost/shared_ptr.hpp>

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace ox::graphics {
class CRenderer;
}

namespace ox::gui {

class CBaseWidget;
class CWidget;
class CLayoutBox;

using BaseWidgetPtrT = boost::intrusive_ptr<CBaseWidget>;
using WidgetPtrT = boost::intrusive_ptr<CWidget>;
using LayoutBoxPtrT = boost::shared_ptr<CLayoutBox>;

enum WidgetFlags : uint32_t {
    FlagHidden = 1,        // not drawn; still updated and still gets input
    FlagDisabled = 2,      // no input, no DoUpdate; still drawn, children still updated
    FlagClipDraw = 4,      // drawing is clipped to the widget's rectangle
    FlagDead = 8,          // dropped by the parent's next update
    FlagDrawFloatRect = 16 // drawn at its exact offset rather than at whole pixels
};

enum WidgetAnchors : uint32_t { AnchorLeft = 1, AnchorRight = 2, AnchorTop = 4, AnchorBottom = 8 };

// Layers are compared as unsigned numbers: always-on-top is the largest.
enum WidgetLayers : uint32_t { LayerTop = 0, LayerAlwaysOnTop = 0xFFFFFFFFu };

enum MouseButtons : int { LeftButton = 0, RightButton = 1, MiddleButton = 2 };

enum KeyMasks : int { ShiftPressed = 1, ControlPressed = 2, AltPressed = 4 };

// The events a widget asks for in the broadcast pass, whether or not it is under the pointer.
enum BroadcastMasks : uint32_t {
    BroadcastOnChar = 1,
    BroadcastOnKeyDown = 2,
    BroadcastOnKeyUp = 4,
    BroadcastOnMouseMove = 8,
    BroadcastOnMouseDrag = 16,
    BroadcastOnMouseDown = 32,
    BroadcastOnMouseUp = 64,
    BroadcastOnDoubleClick = 128,
    BroadcastOnMouseWheel = 256,
};

class CBaseWidget : public misc::CRefCountedObj {
public:
    using WidgetsT = std::vector<WidgetPtrT>;
    using EffectsT = std::vector<EffectPtrT>;
    using IntVector = misc::IntVector;
    using FloatVector = misc::FloatVector;

    explicit CBaseWidget(std::string_view id = {});
    ~CBaseWidget() override;
    CBaseWidget(const CBaseWidget&) = delete;
    CBaseWidget& operator=(const CBaseWidget&) = delete;

    virtual void SetOffset(float x, float y);
    // The position of the top-left corner in the coordinates of the tree's top.
    virtual FloatVector GetAbsPos(bool toScreen) const = 0;
    // Stores the size; the layout box shares it out; the children follow their anchors.
    virtual void SetSize(float width, float height);
    virtual FloatVector GetPreferredSize() const { return {}; }
    virtual void SetRotation(const misc::FloatMatrix& rotation)
    {
        m_Rotation = rotation;
        m_Rotated = !(rotation == misc::FloatMatrix::Identity());
    }
    virtual void SetColor(const graphics::Color& color) { m_Color = color; }
    virtual void SetChildFocused(CWidget* /*child*/) {}
    // What a control tells its parent ("pressed", "selected", ...).
    virtual void OnChildAction(const std::string& /*action*/, CWidget* /*sender*/) {}
    virtual void OnChildLayerChanged(CWidget* child);
    virtual void OnHiddenChanged(bool /*hidden*/) {}
    // The broadcast masks below this widget changed (a child came or went, a mask was set).
    virtual void OnChildrenMaskChanged() {}
    virtual void OnDisabledChanged(bool /*disabled*/) {}

    // Input. Positions are in this widget's own coordinates; `broadcast` false is the
    // hit-test pass, true the pass to those that asked by mask. The result says whether the
    // event was handled; the base passes it on to the children.
    virtual bool OnChar(wchar character, int keys, int rawKeyData, bool broadcast);
    virtual bool OnKeyDown(int key, int keys, int rawKeyData, bool broadcast);
    virtual bool OnKeyUp(int key, int keys, int rawKeyData, bool broadcast);
    virtual bool OnMouseMove(const IntVector& pos, int keys, bool broadcast);
    virtual bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast);
    virtual bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast);
    virtual bool OnDoubleClick(const IntVector& pos, int keys, bool broadcast);
    virtual bool OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast);

    // Reads id, x, y and color, then the layout box with the child elements (which builds
    // the children through the widget factory), then tool_tip_text.
    virtual void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates);
    // The widget's own drawing; the base draws the children, back to front.
    virtual void DoDraw(graphics::CRenderer& renderer);
    // The widget's own per-frame work; the base does nothing.
    virtual void DoUpdate() {}
    // Whether this widget's class reads child elements of this name from its description
    // itself; the layout box loader then leaves them alone.
    virtual bool ReadsChildElement(std::string_view /*element*/) const { return false; }

    // The per-frame walks.
    void Update();
    void Draw(graphics::CRenderer& renderer);

    // Children. A widget joins in front of the children of its layer; RemoveWidget only marks
    // it dead (the next Update drops it); RemoveAllWidgets is immediate.
    void AddWidget(WidgetPtrT widget);
    bool RemoveWidget(CWidget* widget);
    bool RemoveWidget(const WidgetPtrT& widget) { return RemoveWidget(widget.get()); }
    void RemoveAllWidgets();
    // The first child with the id; with `recursive`, only then the children's subtrees in order.
    CWidget* GetWidget(std::string_view id, bool recursive = false) const;
    const WidgetsT& GetWidgets() const { return m_ChildWidgets; }
    // `child` takes the layer of `inFrontOf` and stands directly before it.
    void LayChildWidgetInFront(CWidget& _child, const CWidget& _in_front_of_widget);
    // Orders the children by layer, the highest in front.
    void SortChildren();

    // Gives the widget a tool tip (a helper child that watches the pointer), or a new text
    // for the one it has.
    void AddToolTip(const wstring& text);

    void AddEffect(EffectPtrT effect);
    void RemoveAllEffects() { m_Effects.clear(); }
    const EffectsT& GetEffects() const { return m_Effects; }

    uint32_t GetFlags() const { return m_Flags; }
    void SetFlags(uint32_t flags);
    void AddFlags(uint32_t flags) { SetFlags(m_Flags | flags); }
    void RemFlags(uint32_t flags) { SetFlags(m_Flags & ~flags); }

    const std::string& GetId() const { return m_Id.Get(); }
    void SetId(std::string_view id) { m_Id = core::CSettingsRefCountedConstString(id); }
    const FloatVector& GetOffset() const { return m_Offset; }
    const FloatVector& GetSize() const { return m_Size; }
    const misc::FloatMatrix& GetRotation() const { return m_Rotation; }
    const graphics::Color& GetColor() const { return m_Color; }
    const misc::FloatInsets& GetInsets() const { return m_Insets; }
    void SetInsets(const misc::FloatInsets& insets) { m_Insets = insets; }

    // The four corners in the parent's coordinates.
    misc::Poly4 GetPoly() const;
    // A point from the parent's coordinates into this widget's own, to whole pixels.
    IntVector AdaptPos(const IntVector& pos) const;
    // Whether a point in the parent's coordinates lies inside the widget's polygon.
    bool ContainsPoint(const FloatVector& point) const;

    // The layout box of a loaded widget (null for one built by code).
    const LayoutBoxPtrT& GetLayoutBox() const { return m_LayoutBox; }
    // Measures the box tree bottom-up and places the widgets; nothing without a box.
    void UpdateLayout();
    // Places the widgets again at their present sizes.
    void UpdateLayoutOffsets();

    // Whether the base DoDraw outlines every widget (the application's debug_render setting).
    static void SetDebugRender(bool on);

protected:
    // The base dispatch of each input event, which a child's mask-less walk also uses.
    template <class Call>
    bool DispatchPointer(uint32_t bit, const IntVector& pos, bool broadcast, const Call& call);
    template <class Call>
    bool DispatchKey(uint32_t bit, const Call& call);

private:
    void PurgeDeadChildren();
    void UpdateEffects();

    core::CSettingsRefCountedConstString m_Id;
    FloatVector m_Offset;
    FloatVector m_Size;
    misc::FloatMatrix m_Rotation;
    bool m_Rotated = false; // the rotation is not the identity
    graphics::Color m_Color;
    uint32_t m_Flags = 0;
    misc::FloatInsets m_Insets;
    WidgetsT m_ChildWidgets; // index 0 is in front
    LayoutBoxPtrT m_LayoutBox;
    bool m_NeedSort = false;
    EffectsT m_Effects;
};

} // namespace ox::gui
