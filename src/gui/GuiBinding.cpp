#include "gui/GuiBinding.h"

#include "graphics/Renderer.h"
#include "gui/Cursor.h"
#include "gui/LuaWidget.h"
#include "gui/TimedEffects.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/CheckboxWidget.h"
#include "gui/controls/ClipWidget.h"
#include "gui/controls/EditWidget.h"
#include "gui/controls/ImageBoxWidget.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/LabelWidget.h"
#include "gui/controls/ProgressBarWidget.h"
#include "gui/controls/RadioButtonGroupWidget.h"
#include "gui/controls/ComboBoxWidget.h"
#include "gui/controls/ListWidget.h"
#include "gui/controls/ScrollWidget.h"
#include "gui/controls/SliderWidget.h"
#include "gui/controls/ToolTipHelperWidget.h"
#include "gui/controls/ToolbarWidget.h"
#include "gui/controls/TabWidget.h"
#include "gui/Window.h"
#include "gui/WidgetManager.h"
#include "lua/Lua.h"
#include "lua/mluabind/StdBinding.h"

namespace ox::gui {

using misc::IntVector;
using mluabind::Adopt;
using mluabind::Class;
using mluabind::Constant;

namespace {

struct NamedValue {
    const char* name;
    int value;
};

constexpr NamedValue kKeyCodes[] = {
    {"OX_NONE", OX_NONE},     {"OX_LEFT", OX_LEFT},     {"OX_RIGHT", OX_RIGHT},   {"OX_UP", OX_UP},
    {"OX_DOWN", OX_DOWN},     {"OX_HOME", OX_HOME},     {"OX_END", OX_END},       {"OX_PGUP", OX_PGUP},
    {"OX_PGDOWN", OX_PGDOWN}, {"OX_INSERT", OX_INSERT}, {"OX_DELETE", OX_DELETE}, {"OX_SPACE", OX_SPACE},
    {"OX_BACK", OX_BACK},     {"OX_RETURN", OX_RETURN}, {"OX_TAB", OX_TAB},       {"OX_ESC", OX_ESC},
    {"OX_F1", OX_F1},         {"OX_F2", OX_F2},         {"OX_F3", OX_F3},         {"OX_F4", OX_F4},
    {"OX_F5", OX_F5},         {"OX_F6", OX_F6},         {"OX_F7", OX_F7},         {"OX_F8", OX_F8},
    {"OX_F9", OX_F9},         {"OX_F10", OX_F10},       {"OX_F11", OX_F11},       {"OX_F12", OX_F12},
    {"OX_OEM_2", OX_OEM_2},   {"JustifyLeft", -1},      {"JustifyCenterH", 0},    {"JustifyRight", 1},
    {"JustifyTop", -1},       {"JustifyCenterV", 0},    {"JustifyBottom", 1},
};

constexpr NamedValue kWidgetConstants[] = {
    {"FlagHidden", FlagHidden},
    {"FlagDisabled", FlagDisabled},
    {"FlagClipDraw", FlagClipDraw},
    {"FlagDead", FlagDead},
    {"FlagDrawFloatRect", FlagDrawFloatRect},
    {"AnchorLeft", AnchorLeft},
    {"AnchorRight", AnchorRight},
    {"AnchorTop", AnchorTop},
    {"AnchorBottom", AnchorBottom},
    {"LayerTop", LayerTop},
    {"LayerAlwaysOnTop", -1},
    {"LeftButton", LeftButton},
    {"RightButton", RightButton},
    {"MiddleButton", MiddleButton},
    {"ShiftPressed", ShiftPressed},
    {"ControlPressed", ControlPressed},
    {"AltPressed", AltPressed},
    {"BroadcastOnChar", BroadcastOnChar},
    {"BroadcastOnKeyDown", BroadcastOnKeyDown},
    {"BroadcastOnKeyUp", BroadcastOnKeyUp},
    {"BroadcastOnMouseMove", BroadcastOnMouseMove},
    {"BroadcastOnMouseDrag", BroadcastOnMouseDrag},
    {"BroadcastOnMouseDown", BroadcastOnMouseDown},
    {"BroadcastOnMouseUp", BroadcastOnMouseUp},
    {"BroadcastOnDoubleClick", BroadcastOnDoubleClick},
    {"BroadcastOnMouseWheel", BroadcastOnMouseWheel},
};

constexpr NamedValue kCursorTypes[] = {
    {"CursorPointer", CCursor::CursorPointer},     {"CursorHand", CCursor::CursorHand},
    {"CursorText", CCursor::CursorText},           {"CursorHourglass", CCursor::CursorHourglass},
    {"CursorCustom", CCursor::CursorCustom},       {"CursorNone", CCursor::CursorNone},
};

template <class C, size_t N>
C& WithConstants(C& cls, const NamedValue (&values)[N])
{
    for (const NamedValue& v : values)
        cls.Constant(v.name, v.value);
    return cls;
}

mluabind::i::GenericClass& BaseWidgetClass()
{
    using W = CBaseWidget;
    auto& cls = Class<W>("CBaseWidget")
                    .Method("SetOffset", &W::SetOffset)
                    .Method("GetAbsPos", &W::GetAbsPos)
                    .Method("SetSize", &W::SetSize)
                    .Method("GetPreferredSize", &W::GetPreferredSize)
                    .Method("SetRotation", &W::SetRotation)
                    .Method("SetColor", &W::SetColor)
                    .Method("SetColor", [](W& w, uint32_t argb) { w.SetColor(graphics::Color(argb)); })
                    .Method("SetChildFocused", &W::SetChildFocused)
                    .Method("OnChildAction", &W::OnChildAction)
                    .Method("OnChar", &W::OnChar)
                    .Method("OnKeyDown", &W::OnKeyDown)
                    .Method("OnKeyUp", &W::OnKeyUp)
                    .Method("OnMouseMove", &W::OnMouseMove)
                    .Method("OnMouseDown", &W::OnMouseDown)
                    .Method("OnMouseUp", &W::OnMouseUp)
                    .Method("OnDoubleClick", &W::OnDoubleClick)
                    .Method("OnMouseWheel", &W::OnMouseWheel)
                    .Method("Load", &W::Load)
                    .Method("DoDraw", &W::DoDraw)
                    .Method("DoUpdate", &W::DoUpdate)
                    .Method("Update", &W::Update)
                    .Method("Draw", &W::Draw)
                    .Method("AddWidget", &W::AddWidget)
                    .Method("AddWidget", [](W& w, CWidget* child) { w.AddWidget(WidgetPtrT(child)); }, Adopt(1))
                    .Method("RemoveWidget", static_cast<bool (W::*)(CWidget*)>(&W::RemoveWidget))
                    .Method("RemoveWidget", static_cast<bool (W::*)(const WidgetPtrT&)>(&W::RemoveWidget))
                    .Method("RemoveAllWidgets", &W::RemoveAllWidgets)
                    .Method("GetWidget", [](W& w, const char* id) { return w.GetWidget(id ? id : ""); })
                    .Method("GetWidget", [](W& w, const char* id, bool recursive) {
                        return w.GetWidget(id ? id : "", recursive);
                    })
                    .Method("AddEffect", &W::AddEffect)
                    .Method("AddEffect", [](W& w, CEffect* effect) { w.AddEffect(EffectPtrT(effect)); }, Adopt(1))
                    .Method("AddToolTip", &W::AddToolTip)
                    .Method("AddToolTip", [](W& w, const char16_t* text) { w.AddToolTip(text ? text : u""); })
                    .Method("RemoveAllEffects", &W::RemoveAllEffects)
                    .Method("GetFlags", &W::GetFlags)
                    .Method("SetFlags", &W::SetFlags)
                    .Method("AddFlags", &W::AddFlags)
                    .Method("RemFlags", &W::RemFlags)
                    .Method("GetPoly", &W::GetPoly)
                    .Method("AdaptPos", &W::AdaptPos)
                    .Method("UpdateLayout", &W::UpdateLayout)
                    .Method("UpdateLayoutOffsets", &W::UpdateLayoutOffsets)
                    .Method("GetId", &W::GetId)
                    .Method("GetSize", &W::GetSize)
                    .Method("GetOffset", &W::GetOffset)
                    .Method("GetInsets", &W::GetInsets)
                    .Method("SetInsets", &W::SetInsets)
                    .Method("GetRotation", &W::GetRotation)
                    .Method("GetColor", &W::GetColor);
    return WithConstants(cls, kWidgetConstants);
}

mluabind::i::GenericClass& WidgetClass()
{
    using W = CWidget;
    return Class<W>("CWidget")
        .BaseClass<CBaseWidget>()
        .Constructor<>()
        .Method("SetParentWidget", &W::SetParentWidget)
        .Method("ClearParentWidget", &W::ClearParentWidget)
        .Method("SetFocused", &W::SetFocused)
        .Method("OnParentSizeChanged", &W::OnParentSizeChanged)
        .Method("GetParentWidget", &W::GetParentWidget)
        .Method("SetLayer", &W::SetLayer)
        .Method("GetLayer", &W::GetLayer)
        .Method("GetAnchors", &W::GetAnchors)
        .Method("SetAnchors", &W::SetAnchors)
        .Method("GetBroadcastMask", &W::GetBroadcastMask)
        .Method("SetBroadcastMask", &W::SetBroadcastMask)
        .Method("GetChildrenBroadcastMask", &W::GetChildrenBroadcastMask)
        .Method("IsFocused", &W::IsFocused)
        .Method("LayInFront", &W::LayInFront);
}

mluabind::i::GenericClass& BaseWindowClass()
{
    using W = CBaseWindow;
    // A window a script made (and owns) passes into the keeping of the window it goes on.
    return Class<W>("CBaseWindow")
        .BaseClass<CBaseWidget>()
        .Method("DoModal", [](W& w, W* window) { return w.DoModal(BaseWindowPtrT(window)); }, Adopt(1))
        .Method("EndModal", &W::EndModal)
        .Method("AddChildWindow", [](W& w, W* window) { w.AddChildWindow(BaseWindowPtrT(window)); }, Adopt(1))
        .Method("RemoveChildWindow", &W::RemoveChildWindow)
        .Method("GetChildWindow", [](W& w) -> W* { return w.GetChildWindow(); })
        .Method("GetChildWindow", [](const W& w) -> const W* { return w.GetChildWindow(); })
        .Method("GetParentWindow", &W::GetParentWindow)
        .Method("GetAbsPos", &W::GetAbsPos)
        .Method("OnMouseMove", &W::OnMouseMove);
}

// The default handling of a window's input, in the form a hook gets its arguments.
mluabind::i::GenericClass& WindowClass()
{
    using W = CWindow;
    return Class<W>("CWindow")
        .BaseClass<CBaseWindow>()
        .Constructor<>()
        .Method("SetCanDrag", &W::SetCanDrag)
        .Method("IsCanDrag", &W::IsCanDrag)
        .Method("HideToolTip", &W::HideToolTip)
        .Method("SuperOnChar", &W::SuperOnChar)
        .Method("SuperOnKeyDown", &W::SuperOnKeyDown)
        .Method("SuperOnKeyUp", &W::SuperOnKeyUp)
        .Method("SuperOnMouseMove", &W::SuperOnMouseMove)
        .Method("SuperOnMouseMove",
                [](W& w, int x, int y, int keys, bool broadcast) { return w.SuperOnMouseMove({x, y}, keys, broadcast); })
        .Method("SuperOnMouseDown", &W::SuperOnMouseDown)
        .Method("SuperOnMouseDown",
                [](W& w, int x, int y, int button, int keys, bool broadcast) {
                    return w.SuperOnMouseDown({x, y}, static_cast<MouseButtons>(button), keys, broadcast);
                })
        .Method("SuperOnMouseUp", &W::SuperOnMouseUp)
        .Method("SuperOnMouseUp",
                [](W& w, int x, int y, int button, int keys, bool broadcast) {
                    return w.SuperOnMouseUp({x, y}, static_cast<MouseButtons>(button), keys, broadcast);
                })
        .Method("SuperOnDoubleClick", &W::SuperOnDoubleClick)
        .Method("SuperOnDoubleClick",
                [](W& w, int x, int y, int keys, bool broadcast) { return w.SuperOnDoubleClick({x, y}, keys, broadcast); })
        .Method("SuperOnMouseWheel", &W::SuperOnMouseWheel)
        .Method("SuperOnMouseWheel",
                [](W& w, int x, int y, int delta, int keys, bool broadcast) {
                    return w.SuperOnMouseWheel({x, y}, delta, keys, broadcast);
                })
        .Method("SuperOnChildAction", &W::SuperOnChildAction);
}

mluabind::i::GenericClass& LuaWidgetClass()
{
    using W = CLuaWidget;
    return Class<W>("CLuaWidget")
        .BaseClass<CWidget>()
        .Constructor<>()
        .Method("SetLua", &W::SetLua)
        .Method("SetOverloadTable", &W::SetOverloadTable)
        .Method("GetOverloadTable", &W::GetOverloadTable)
        .Method("BaseDoDraw", &W::BaseDoDraw)
        .Method("BaseDoUpdate", &W::BaseDoUpdate);
}

mluabind::i::GenericClass& CursorClass()
{
    using C = CCursor;
    auto& cls = Class<C>("CCursor")
                    .Method("SetCursor", &C::SetCursor)
                    .Method("GetCursor", &C::GetCursor)
                    .Method("SetCustomCursor", &C::SetCustomCursor)
                    .Method("HideCursor", &C::HideCursor)
                    .Method("IsHidden", &C::IsHidden)
                    .Method("EnableCustomCursors", &C::EnableCustomCursors)
                    .Method("IsCustomCursorsEnabled", &C::IsCustomCursorsEnabled)
                    .Method("GetPosition", &C::GetPosition);
    return WithConstants(cls, kCursorTypes);
}


// Effects ---------------------------------------------------------------------------------------

void BindEffects(mluabind::Namespace& ns)
{
    ns.AddClass(Class<CEffect>("CEffect")
                    .Method("InitWidget", &CEffect::InitWidget)
                    .Method("UpdateWidget", &CEffect::UpdateWidget)
                    .Method("IsDead", &CEffect::IsDead)
                    .Method("SetDead", &CEffect::SetDead));
    ns.AddClass(mluabind::IntrusivePtrClass<CEffect>("CEffectPtrT"));
    using P = CPositionChangeEffect;
    ns.AddClass(Class<P>("CPositionChangeEffect")
                    .BaseClass<CEffect>()
                    .Constructor<const misc::FloatVector&, float, float, const char*>()
                    .Constructor<float, float, float, float, const char*>()
                    .Method("InitWidget", &P::InitWidget)
                    .Method("UpdateWidget", &P::UpdateWidget));
    using C = CColorChangeEffect;
    ns.AddClass(Class<C>("CColorChangeEffect")
                    .BaseClass<CEffect>()
                    .Constructor<const graphics::Color&, float, float, const char*>()
                    .Constructor<uint32_t, float, float, const char*>()
                    .Method("InitWidget", &C::InitWidget)
                    .Method("UpdateWidget", &C::UpdateWidget));
    ns.AddClass(Class<CFlagsChangeEffect>("CFlagsChangeEffect")
                    .BaseClass<CEffect>()
                    .Constructor<uint32_t, bool, float, const char*>());
}

// Controls --------------------------------------------------------------------------------------

constexpr NamedValue kStretchTypes[] = {
    {"StretchMaximum", CImageWidget::StretchMaximum},
    {"StretchProportional", CImageWidget::StretchProportional},
    {"StretchOnlyDecrease", CImageWidget::StretchOnlyDecrease},
    {"StretchNo", CImageWidget::StretchNo},
};

constexpr NamedValue kButtonStates[] = {
    {"StateNormal", CButtonWidget::StateNormal},
    {"StateOver", CButtonWidget::StateOver},
    {"StatePressed", CButtonWidget::StatePressed},
    {"StateDisabled", CButtonWidget::StateDisabled},
};

mluabind::i::GenericClass& ImageWidgetClass()
{
    using W = CImageWidget;
    auto& cls = Class<W>("CImageWidget")
                    .BaseClass<CWidget>()
                    .Constructor<>()
                    .Method("SetImage", static_cast<void (W::*)(const char*)>(&W::SetImage))
                    .Method("SetImage", static_cast<void (W::*)(const graphics::CTexture*)>(&W::SetImage))
                    .Method("GetImage", [](W& w) -> graphics::CImage& { return w.GetImage(); })
                    .Method("GetImage", [](const W& w) -> const graphics::CImage& { return w.GetImage(); })
                    .Method("SetStretchType", &W::SetStretchType)
                    .Method("GetStretchType", &W::GetStretchType);
    return WithConstants(cls, kStretchTypes);
}

mluabind::i::GenericClass& LabelWidgetClass()
{
    using W = CLabelWidget;
    return Class<W>("CLabelWidget")
        .BaseClass<CWidget>()
        .Constructor<>()
        .Method("ResizeToFitText", static_cast<void (W::*)(bool)>(&W::ResizeToFitText))
        .Method("SetText", &W::SetText)
        .Method("GetText", &W::GetText)
        .Method("SetJustifications", &W::SetJustifications)
        .Method("SetFontScale", &W::SetFontScale)
        .Method("SetWordBreak", &W::SetWordBreak);
}

mluabind::i::GenericClass& ButtonWidgetClass()
{
    using W = CButtonWidget;
    auto& cls = Class<W>("CButtonWidget")
                    .BaseClass<CWidget>()
                    .Constructor<>()
                    .Method("SetText", &W::SetText)
                    .Method("GetText", &W::GetText)
                    .Method("SetLabelColor", &W::SetLabelColor)
                    .Method("GetButtonState", [](const W& w) { return static_cast<int>(w.GetButtonState()); })
                    .Method("GetButtonStateInt", &W::GetButtonStateInt)
                    .Method("DisableButton", &W::DisableButton)
                    .Method("OnButtonPressed", &W::OnButtonPressed)
                    .Method("OnMouseMove", &W::OnMouseMove);
    return WithConstants(cls, kButtonStates);
}

// Scripts get widgets by their static type (a sender, GetWidget): `<Class>.Cast(widget)`
// gives the widget as the control it is, or nil.
template <class W>
void AddCast(mluabind::Namespace& ns, const char* name)
{
    ns.AddFunction(mluabind::Function(name, [](CBaseWidget* widget) { return dynamic_cast<W*>(widget); }));
}

void BindEditWidget(mluabind::Namespace& ns)
{
    using E = CEditWidget;
    ns.AddClass(Class<E>("CEditWidget")
                    .BaseClass<CWidget>()
                    .Constructor<>()
                    .Method("SetEditColors", &E::SetEditColors)
                    .Method("SelectText", &E::SelectText)
                    .Method("SetText", &E::SetText)
                    .Method("GetText", &E::GetText)
                    .Method("SetTextJustification", &E::SetTextJustification)
                    .Method("SetMaxChars", &E::SetMaxChars)
                    .Method("OnTextChanged", &E::OnTextChanged));
    AddCast<E>(ns, "CEditWidget.Cast");
}

// The composite controls: tabs.
void BindComposites(mluabind::Namespace& ns)
{
    using T = CTabWidget;
    ns.AddClass(Class<T>("CTabWidget")
                    .BaseClass<CWidget>()
                    .Constructor<>()
                    .Method("EnumPanels", &T::EnumPanels)
                    .Method("SelectPanel", &T::SelectPanel)
                    .Method("GetSelectedPanel", &T::GetSelectedPanel)
                    .Method("GetPanelContent", static_cast<CWidget* (T::*)(int) const>(&T::GetPanelContent))
                    .Method("GetPanelContent", static_cast<CWidget* (T::*)(const wstring&) const>(&T::GetPanelContent)));
    AddCast<T>(ns, "CTabWidget.Cast");
}

void BindControls(mluabind::Namespace& ns)
{
    ns.AddClass(ImageWidgetClass());
    ns.AddClass(LabelWidgetClass());
    ns.AddClass(Class<CClipWidget>("CClipWidget").BaseClass<CWidget>().Constructor<>().Method("GetClip", &CClipWidget::GetClip));
    ns.AddClass(ButtonWidgetClass());
    using C = CCheckboxWidget;
    ns.AddClass(Class<C>("CCheckboxWidget")
                    .BaseClass<CWidget>()
                    .Constructor<>()
                    .Method("Check", &C::Check)
                    .Method("IsChecked", &C::IsChecked)
                    .Method("SetUnspecifiedState", &C::SetUnspecifiedState)
                    .Method("OnCheckChanged", &C::OnCheckChanged));
    using R = CRadioButtonGroupWidget;
    ns.AddClass(Class<R>("CRadioButtonGroupWidget")
                    .BaseClass<CWidget>()
                    .Constructor<>()
                    .Method("GetChecked", &R::GetChecked)
                    .Method("Check", static_cast<void (R::*)(int)>(&R::Check))
                    .Method("OnChangeChecked", &R::OnChangeChecked));
    using P = CProgressBarWidget;
    ns.AddClass(Class<P>("CProgressBarWidget")
                    .BaseClass<CWidget>()
                    .Constructor<>()
                    .Method("SetImages", &P::SetImages)
                    .Method("SetValue", &P::SetValue)
                    .Method("GetValue", &P::GetValue));
    ns.AddClass(Class<CToolbarWidget>("CToolbarWidget").BaseClass<CWidget>().Constructor<>());
    ns.AddClass(Class<CImageBoxWidget>("CImageBoxWidget").BaseClass<CWidget>().Constructor<>());
    ns.AddClass(Class<CToolTipHelperWidget>("CToolTipHelperWidget")
                    .BaseClass<CWidget>()
                    .Method("StopShowToolTip", &CToolTipHelperWidget::StopShowToolTip));
    AddCast<CImageWidget>(ns, "CImageWidget.Cast");
    AddCast<CLabelWidget>(ns, "CLabelWidget.Cast");
    AddCast<CClipWidget>(ns, "CClipWidget.Cast");
    AddCast<CButtonWidget>(ns, "CButtonWidget.Cast");
    AddCast<CCheckboxWidget>(ns, "CCheckboxWidget.Cast");
    AddCast<CRadioButtonGroupWidget>(ns, "CRadioButtonGroupWidget.Cast");
    AddCast<CProgressBarWidget>(ns, "CProgressBarWidget.Cast");
    AddCast<CToolbarWidget>(ns, "CToolbarWidget.Cast");
    AddCast<CImageBoxWidget>(ns, "CImageBoxWidget.Cast");
    AddCast<CWindow>(ns, "CWindow.Cast");
    BindEditWidget(ns);
}

constexpr NamedValue kListColors[] = {
    {"ListColorTextNormal", CListWidget::ListColorTextNormal},
    {"ListColorTextSelected", CListWidget::ListColorTextSelected},
    {"ListColorTextOver", CListWidget::ListColorTextOver},
    {"ListColorSelection", CListWidget::ListColorSelection},
};

// The line operations a list and a combo box share; texts come as wide strings or plain
// Lua strings.
template <class W, class C>
C& LineMethods(C& cls)
{
    return cls.Method("ClearLines", &W::ClearLines)
        .Method("EnumLines", &W::EnumLines)
        .Method("AddLine", [](W& w, const char16_t* text) { w.AddLine(text ? text : u""); })
        .Method("GetLine", &W::GetLine)
        .Method("FindLine", [](const W& w, const char16_t* text) { return w.FindLine(text ? text : u""); })
        .Method("SetLine", [](W& w, int index, const char16_t* text) { w.SetLine(index, text ? text : u""); })
        .Method("RemoveLine", &W::RemoveLine)
        .Method("SelectLine", &W::SelectLine)
        .Method("GetSelectedLine", &W::GetSelectedLine);
}

mluabind::i::GenericClass& ListWidgetClass()
{
    using W = CListWidget;
    auto& cls = Class<W>("CListWidget").BaseClass<CWidget>().Constructor<>();
    LineMethods<W>(cls)
        .Method("CalcHeightToFitLines", &W::CalcHeightToFitLines)
        .Method("SetListHeight", &W::SetListHeight)
        .Method("GetScrollWidth", &W::GetScrollWidth)
        .Method("SetScrollValue", &W::SetScrollValue)
        .Method("GetScrollValue", &W::GetScrollValue)
        .Method("SetLineJustifications", &W::SetLineJustifications)
        .Method("SetListColors", &W::SetListColors)
        .Method("OnLineSelected", &W::OnLineSelected);
    return WithConstants(cls, kListColors);
}

mluabind::i::GenericClass& ComboBoxWidgetClass()
{
    using W = CComboBoxWidget;
    auto& cls = Class<W>("CComboBoxWidget").BaseClass<CWidget>().Constructor<>();
    return LineMethods<W>(cls)
        .Method("ShowList", &W::ShowList)
        .Method("IsListShown", &W::IsListShown)
        .Method("GetText", &W::GetText)
        .Method("OnLineSelected", &W::OnLineSelected);
}

// The value controls: scroll bar, slider, list and combo box.
void BindValueControls(mluabind::Namespace& ns)
{
    using S = CScrollWidget;
    ns.AddClass(Class<S>("CScrollWidget")
                    .BaseClass<CWidget>()
                    .Constructor<>()
                    .Constructor<bool>()
                    .Method("SetValue", &S::SetValue)
                    .Method("GetValue", &S::GetValue)
                    .Method("SetMaxValue", &S::SetMaxValue)
                    .Method("GetMaxValue", &S::GetMaxValue)
                    .Method("SetPageSize", &S::SetPageSize)
                    .Method("GetPageSize", &S::GetPageSize)
                    .Method("SetButtonValue", &S::SetButtonValue)
                    .Method("SetImages", &S::SetImages)
                    .Method("OnValueChanged", &S::OnValueChanged));
    AddCast<S>(ns, "CScrollWidget.Cast");
    using L = CSliderWidget;
    ns.AddClass(Class<L>("CSliderWidget")
                    .BaseClass<CWidget>()
                    .Constructor<>()
                    .Method("SetValue", &L::SetValue)
                    .Method("GetValue", &L::GetValue)
                    .Method("SetImages", &L::SetImages)
                    .Method("OnValueChanged", &L::OnValueChanged));
    AddCast<L>(ns, "CSliderWidget.Cast");
    ns.AddClass(Class<CThumbWidget>("CThumbWidget").BaseClass<CImageWidget>().Constructor<>());
    ns.AddClass(ListWidgetClass());
    AddCast<CListWidget>(ns, "CListWidget.Cast");
    ns.AddClass(ComboBoxWidgetClass());
    AddCast<CComboBoxWidget>(ns, "CComboBoxWidget.Cast");
}

} // namespace

mluabind::Namespace BindGui()
{
    mluabind::Namespace ns("gui");
    for (const NamedValue& v : kKeyCodes)
        ns.AddConstant(Constant(v.name, v.value));
    ns.AddClass(BaseWidgetClass());
    ns.AddClass(WidgetClass());
    ns.AddClass(mluabind::IntrusivePtrClass<CBaseWidget>("CBaseWidgetPtrT"));
    ns.AddClass(mluabind::IntrusivePtrClass<CWidget>("CWidgetPtrT"));
    ns.AddClass(BaseWindowClass());
    ns.AddClass(WindowClass());
    ns.AddClass(LuaWidgetClass());
    ns.AddClass(CursorClass());
    ns.AddFunction(mluabind::Function("CCursor.Instance", &CCursor::Instance));
    ns.AddFunction(mluabind::Function("g_Cursor.Instance", &CCursor::Instance));
    ns.AddClass(Class<CWidgetManager>("CWidgetManager").Method("GetKeyboardState", &CWidgetManager::GetKeyboardState));
    BindEffects(ns);
    BindComposites(ns);
    BindControls(ns);
    BindValueControls(ns);
    return ns;
}

// --- the whole GUI vocabulary, for the framework's roof list ---

namespace {

template <class T>
mluabind::i::GenericClass& InsetsClass(const char* name)
{
    using I = misc::Insets<T>;
    return Class<I>(name)
        .template Constructor<>()
        .template Constructor<T, T, T, T>()
        .Member("Left", &I::Left)
        .Member("Right", &I::Right)
        .Member("Top", &I::Top)
        .Member("Bottom", &I::Bottom);
}

} // namespace

void BindGuiVocabulary(mluabind::CHost& host)
{
    using WidgetsT = CBaseWidget::WidgetsT;
    using Widget = WidgetsT::value_type;
    mluabind::Namespace ns = BindGui();
    ns.AddClass(InsetsClass<int>("IntInsets"));
    ns.AddClass(InsetsClass<float>("FloatInsets"));
    ns.AddClass(mluabind::i::IteratorClass<WidgetsT::iterator, Widget, true, true>("CBaseWidget.WidgetIteratorT"));
    ns.AddClass(mluabind::i::IteratorClass<WidgetsT::const_iterator, const Widget, true, false>(
        "CBaseWidget.ConstWidgetIteratorT"));
    host.Bind(mluabind::Namespace("ox").Merge(ns));
}

} // namespace ox::gui
