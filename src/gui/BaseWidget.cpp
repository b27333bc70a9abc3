#include "gui/BaseWidget.h"

#include "core/SettingsReaders.h"
#include "graphics/Renderer.h"
#include "gui/Description.h"
#include "gui/LayoutBox.h"
#include "gui/Widget.h"
#include "gui/controls/ToolTipHelperWidget.h"

#include <boost/container/small_vector.hpp>
#include <boost/make_shared.hpp>

#include <algorithm>
#include <cmath>

namespace ox::gui {

using misc::FloatVector;
using misc::IntVector;

namespace {

bool g_DebugRender = false;

// The children at the start of a walk, held so that a handler that changes the list (adds,
// clears) neither invalidates the walk nor destroys a widget that is being called.
using ChildSnapshot = boost::container::small_vector<WidgetPtrT, 16>;

ChildSnapshot Snapshot(const CBaseWidget::WidgetsT& children) { return ChildSnapshot(children.begin(), children.end()); }

CBaseWidget::WidgetsT::iterator Find(CBaseWidget::WidgetsT& children, const CWidget* widget)
{
    return std::find_if(children.begin(), children.end(), [widget](const WidgetPtrT& c) { return c.get() == widget; });
}

bool TakesInput(const CWidget& child) { return (child.GetFlags() & (FlagDisabled | FlagDead)) == 0; }

// Saves the renderer's state for a scope.
class ScopedRenderState {
public:
    explicit ScopedRenderState(graphics::CRenderer& renderer) : m_Renderer(renderer) { m_Renderer.PushState(); }
    ~ScopedRenderState() { m_Renderer.PopState(); }
    ScopedRenderState(const ScopedRenderState&) = delete;
    ScopedRenderState& operator=(const ScopedRenderState&) = delete;

private:
    graphics::CRenderer& m_Renderer;
};

// The local transform: the rotation about the widget's origin, then the move to its offset.
misc::FloatMatrix LocalTransform(const misc::FloatMatrix& rotation, const FloatVector& offset)
{
    return rotation * misc::MatrixTranslation(offset.X, offset.Y);
}

} // namespace

CBaseWidget::CBaseWidget(std::string_view id) : m_Id(id) {}

CBaseWidget::~CBaseWidget()
{
    // A box that outlives its widget in its parent's tree must not reach back to it.
    if (m_LayoutBox)
        m_LayoutBox->DetachWidget();
    // Nor may a child that someone else still holds.
    for (const WidgetPtrT& child : m_ChildWidgets)
        child->ClearParentWidget();
}

void CBaseWidget::SetDebugRender(bool on) { g_DebugRender = on; }

void CBaseWidget::SetOffset(float x, float y) { m_Offset = {x, y}; }

void CBaseWidget::SetSize(float width, float height)
{
    const FloatVector old = m_Size;
    m_Size = {width, height};
    if (m_LayoutBox) {
        m_LayoutBox->DistributeChildren();
        m_LayoutBox->ApplyOffsets(0, 0, true);
    }
    if (old == m_Size)
        return;
    for (const WidgetPtrT& child : Snapshot(m_ChildWidgets))
        child->OnParentSizeChanged(old.X, old.Y);
}

void CBaseWidget::OnChildLayerChanged(CWidget* /*child*/) { m_NeedSort = true; }

void CBaseWidget::SetFlags(uint32_t flags)
{
    const uint32_t changed = m_Flags ^ flags;
    if (changed & FlagHidden)
        OnHiddenChanged((flags & FlagHidden) != 0);
    if (changed & FlagDisabled)
        OnDisabledChanged((flags & FlagDisabled) != 0);
    m_Flags = flags;
}

// Children ------------------------------------------------------------------------------

void CBaseWidget::AddWidget(WidgetPtrT widget)
{
    if (!widget || Find(m_ChildWidgets, widget.get()) != m_ChildWidgets.end())
        return;
    if (widget->GetLayer() == LayerTop) {
        auto below = std::find_if(m_ChildWidgets.begin(), m_ChildWidgets.end(),
                                  [](const WidgetPtrT& c) { return c->GetLayer() != LayerAlwaysOnTop; });
        widget->SetLayer(below == m_ChildWidgets.end() ? 1u : (*below)->GetLayer());
    }
    const uint32_t layer = widget->GetLayer();
    auto place = std::find_if(m_ChildWidgets.begin(), m_ChildWidgets.end(),
                              [layer](const WidgetPtrT& c) { return !(c->GetLayer() > layer); });
    CWidget* added = widget.get();
    m_ChildWidgets.insert(place, std::move(widget));
    added->SetParentWidget(this);
    OnChildrenMaskChanged();
}

bool CBaseWidget::RemoveWidget(CWidget* widget)
{
    if (!widget || Find(m_ChildWidgets, widget) == m_ChildWidgets.end())
        return false;
    widget->AddFlags(FlagDead);
    return true;
}

void CBaseWidget::RemoveAllWidgets()
{
    WidgetsT children;
    children.swap(m_ChildWidgets);
    for (const WidgetPtrT& child : children) {
        child->ClearParentWidget();
        if (m_LayoutBox && child->GetLayoutBox())
            m_LayoutBox->RemoveBox(child->GetLayoutBox().get());
    }
    OnChildrenMaskChanged();
}

CWidget* CBaseWidget::GetWidget(std::string_view id, bool recursive) const
{
    for (const WidgetPtrT& child : m_ChildWidgets)
        if (child->GetId() == id)
            return child.get();
    if (recursive)
        for (const WidgetPtrT& child : m_ChildWidgets)
            if (CWidget* found = child->GetWidget(id, true))
                return found;
    return nullptr;
}

void CBaseWidget::LayChildWidgetInFront(CWidget& _child, const CWidget& _in_front_of_widget)
{
    // Both must be children (a contract of the caller).
    OX_ASSERT(Find(m_ChildWidgets, &_child) != m_ChildWidgets.end());
    OX_ASSERT(Find(m_ChildWidgets, &_in_front_of_widget) != m_ChildWidgets.end());
    auto child = Find(m_ChildWidgets, &_child);
    if (&_child == &_in_front_of_widget || child == m_ChildWidgets.end() ||
        Find(m_ChildWidgets, &_in_front_of_widget) == m_ChildWidgets.end())
        return;
    WidgetPtrT held = *child;
    m_ChildWidgets.erase(child);
    held->SetLayer(_in_front_of_widget.GetLayer());
    m_ChildWidgets.insert(Find(m_ChildWidgets, &_in_front_of_widget), held);
}

void CBaseWidget::SortChildren()
{
    std::stable_sort(m_ChildWidgets.begin(), m_ChildWidgets.end(),
                     [](const WidgetPtrT& a, const WidgetPtrT& b) { return a->GetLayer() > b->GetLayer(); });
    m_NeedSort = false;
}

void CBaseWidget::AddEffect(EffectPtrT effect)
{
    if (!effect)
        return;
    m_Effects.push_back(effect);
    effect->InitWidget(*this);
}

// Geometry --------------------------------------------------------------------------------

misc::Poly4 CBaseWidget::GetPoly() const
{
    const misc::FloatMatrix m = LocalTransform(m_Rotation, m_Offset);
    const misc::Poly4 local = misc::RectToPoly4({0, 0, m_Size.X, m_Size.Y});
    misc::Poly4 poly;
    for (int i = 0; i < 4; ++i)
        poly[i] = m.Transform(local[i]);
    return poly;
}

IntVector CBaseWidget::AdaptPos(const IntVector& pos) const
{
    const FloatVector moved(static_cast<float>(pos.X) - m_Offset.X, static_cast<float>(pos.Y) - m_Offset.Y);
    const FloatVector local = m_Rotated ? misc::MatrixInverse(m_Rotation).Transform(moved) : moved;
    return {static_cast<int>(std::lround(local.X)), static_cast<int>(std::lround(local.Y))};
}

bool CBaseWidget::ContainsPoint(const FloatVector& point) const
{
    // An upright widget's polygon lies within its rectangle: most widgets a point misses
    // are told by four comparisons.
    if (!m_Rotated) {
        const float left = std::min(m_Offset.X, m_Offset.X + m_Size.X), right = std::max(m_Offset.X, m_Offset.X + m_Size.X);
        const float top = std::min(m_Offset.Y, m_Offset.Y + m_Size.Y), bottom = std::max(m_Offset.Y, m_Offset.Y + m_Size.Y);
        if (point.X < left || point.X > right || point.Y < top || point.Y > bottom)
            return false;
    }
    return misc::IsInside(GetPoly(), point);
}

void CBaseWidget::UpdateLayout()
{
    if (!m_LayoutBox)
        return;
    m_LayoutBox->MeasureTree();
    m_LayoutBox->ApplyOffsets(0, 0, true);
}

void CBaseWidget::UpdateLayoutOffsets()
{
    if (m_LayoutBox)
        m_LayoutBox->ApplyOffsets(0, 0, true);
}

// Loading ---------------------------------------------------------------------------------

void CBaseWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    if (node.IsValue("id"))
        SetId(node.GetValue("id"));
    ReadChecked(node, "x", m_Offset.X, -kMaxDescriptionSize, kMaxDescriptionSize);
    ReadChecked(node, "y", m_Offset.Y, -kMaxDescriptionSize, kMaxDescriptionSize);
    core::ReadColor(node, "color", m_Color);
    if (m_LayoutBox)
        m_LayoutBox->DetachWidget();
    m_LayoutBox = boost::make_shared<CLayoutBox>();
    m_LayoutBox->Load(node, templates, this);
    const wstring tip = core::ReadLocalText(node, "tool_tip_text");
    if (!tip.empty())
        AddToolTip(tip);
}

void CBaseWidget::AddToolTip(const wstring& text)
{
    if (auto* helper = dynamic_cast<CToolTipHelperWidget*>(GetWidget(CToolTipHelperWidget::kId))) {
        helper->SetText(text);
        return;
    }
    WidgetPtrT helper(new CToolTipHelperWidget(text));
    helper->SetSize(m_Size.X, m_Size.Y);
    AddWidget(helper);
}

// The per-frame walks ---------------------------------------------------------------------

void CBaseWidget::PurgeDeadChildren()
{
    auto dead = [](const WidgetPtrT& c) { return (c->GetFlags() & FlagDead) != 0; };
    if (std::none_of(m_ChildWidgets.begin(), m_ChildWidgets.end(), dead))
        return;
    WidgetsT children;
    children.swap(m_ChildWidgets);
    for (WidgetPtrT& child : children) {
        if (!dead(child)) {
            m_ChildWidgets.push_back(std::move(child));
            continue;
        }
        child->ClearParentWidget();
        if (m_LayoutBox && child->GetLayoutBox())
            m_LayoutBox->RemoveBox(child->GetLayoutBox().get());
    }
    OnChildrenMaskChanged();
}

void CBaseWidget::UpdateEffects()
{
    m_Effects.erase(std::remove_if(m_Effects.begin(), m_Effects.end(), [](const EffectPtrT& e) { return e->IsDead(); }),
                    m_Effects.end());
    // An effect added by another during this walk runs from the next update on.
    const size_t count = m_Effects.size();
    for (size_t i = 0; i < count && i < m_Effects.size(); ++i) {
        EffectPtrT effect = m_Effects[i];
        effect->UpdateWidget(*this);
    }
}

void CBaseWidget::Update()
{
    PurgeDeadChildren();
    if (!m_Effects.empty())
        UpdateEffects();
    for (const WidgetPtrT& child : Snapshot(m_ChildWidgets))
        if (child->GetParentWidget() == this)
            child->Update();
    if (!(m_Flags & FlagDisabled))
        DoUpdate();
    if (m_NeedSort)
        SortChildren();
}

void CBaseWidget::Draw(graphics::CRenderer& renderer)
{
    ScopedRenderState saved(renderer);
    FloatVector offset = m_Offset;
    if (!(m_Flags & FlagDrawFloatRect))
        offset = {std::trunc(offset.X), std::trunc(offset.Y)};
    renderer.ApplyMatrix(LocalTransform(m_Rotation, offset));
    if (!(m_Color == graphics::Color()))
        renderer.SetColor(renderer.GetColor() * m_Color);
    if (m_Flags & FlagClipDraw)
        renderer.SetClipPoly(misc::RectToPoly4({0, 0, m_Size.X, m_Size.Y}));
    for (size_t i = 0; i < m_Effects.size(); ++i)
        m_Effects[i]->PreDraw(renderer);
    DoDraw(renderer);
    for (size_t i = 0; i < m_Effects.size(); ++i)
        m_Effects[i]->PostDraw(renderer);
}

void CBaseWidget::DoDraw(graphics::CRenderer& renderer)
{
    if (g_DebugRender) {
        const graphics::Color outline(0xFFFF40FFu);
        const float w = m_Size.X, h = m_Size.Y;
        renderer.RenderLine({0, 0}, {w, 0}, outline);
        renderer.RenderLine({w, 0}, {w, h}, outline);
        renderer.RenderLine({w, h}, {0, h}, outline);
        renderer.RenderLine({0, h}, {0, 0}, outline);
    }
    for (size_t i = m_ChildWidgets.size(); i-- > 0;) {
        CWidget& child = *m_ChildWidgets[i];
        if (!(child.GetFlags() & FlagHidden))
            child.Draw(renderer);
    }
}

// Input -----------------------------------------------------------------------------------

// The hit-test pass offers the event to the children under the point, front to back, until
// one handles it; the broadcast pass visits every child whose subtree asked for the event,
// telling only those that asked themselves.
template <class Call>
bool CBaseWidget::DispatchPointer(uint32_t bit, const IntVector& pos, bool broadcast, const Call& call)
{
    bool handled = false;
    const FloatVector point(static_cast<float>(pos.X), static_cast<float>(pos.Y));
    for (const WidgetPtrT& child : Snapshot(m_ChildWidgets)) {
        if (!TakesInput(*child))
            continue;
        if (!broadcast) {
            if (!child->ContainsPoint(point))
                continue;
            if (call(*child, child->AdaptPos(pos), false, false))
                return true;
            continue;
        }
        if (!(child->GetChildrenBroadcastMask() & bit))
            continue;
        const bool asked = (child->GetBroadcastMask() & bit) != 0;
        handled = call(*child, child->AdaptPos(pos), true, !asked) || handled;
    }
    return handled;
}

template <class Call>
bool CBaseWidget::DispatchKey(uint32_t bit, const Call& call)
{
    bool handled = false;
    for (const WidgetPtrT& child : Snapshot(m_ChildWidgets))
        if (TakesInput(*child) && (child->GetChildrenBroadcastMask() & bit))
            handled = call(*child) || handled;
    return handled;
}

bool CBaseWidget::OnChar(wchar character, int keys, int rawKeyData, bool /*broadcast*/)
{
    return DispatchKey(BroadcastOnChar, [&](CWidget& c) { return c.OnChar(character, keys, rawKeyData, true); });
}

bool CBaseWidget::OnKeyDown(int key, int keys, int rawKeyData, bool /*broadcast*/)
{
    return DispatchKey(BroadcastOnKeyDown, [&](CWidget& c) { return c.OnKeyDown(key, keys, rawKeyData, true); });
}

bool CBaseWidget::OnKeyUp(int key, int keys, int rawKeyData, bool /*broadcast*/)
{
    return DispatchKey(BroadcastOnKeyUp, [&](CWidget& c) { return c.OnKeyUp(key, keys, rawKeyData, true); });
}

// In each call below `base` asks for the base dispatch on the child: it is walked without
// being told.
bool CBaseWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    return DispatchPointer(BroadcastOnMouseMove, pos, broadcast, [&](CWidget& c, const IntVector& p, bool b, bool base) {
        return base ? c.CBaseWidget::OnMouseMove(p, keys, b) : c.OnMouseMove(p, keys, b);
    });
}

bool CBaseWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    return DispatchPointer(BroadcastOnMouseDown, pos, broadcast, [&](CWidget& c, const IntVector& p, bool b, bool base) {
        return base ? c.CBaseWidget::OnMouseDown(p, button, keys, b) : c.OnMouseDown(p, button, keys, b);
    });
}

bool CBaseWidget::OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    return DispatchPointer(BroadcastOnMouseUp, pos, broadcast, [&](CWidget& c, const IntVector& p, bool b, bool base) {
        return base ? c.CBaseWidget::OnMouseUp(p, button, keys, b) : c.OnMouseUp(p, button, keys, b);
    });
}

bool CBaseWidget::OnDoubleClick(const IntVector& pos, int keys, bool broadcast)
{
    return DispatchPointer(BroadcastOnDoubleClick, pos, broadcast, [&](CWidget& c, const IntVector& p, bool b, bool base) {
        return base ? c.CBaseWidget::OnDoubleClick(p, keys, b) : c.OnDoubleClick(p, keys, b);
    });
}

bool CBaseWidget::OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    return DispatchPointer(BroadcastOnMouseWheel, pos, broadcast, [&](CWidget& c, const IntVector& p, bool b, bool base) {
        return base ? c.CBaseWidget::OnMouseWheel(p, delta, keys, b) : c.OnMouseWheel(p, delta, keys, b);
    });
}

} // namespace ox::gui
