#include "gui/Window.h"

#include "core/SettingsReaders.h"
#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "gui/Description.h"
#include "gui/GuiServices.h"
#include "gui/TextWidget.h"
#include "gui/WidgetFactory.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/ImageWidget.h"

#include <algorithm>

namespace ox::gui {

namespace {

constexpr int kMaxTileStep = 4096;

// A widget of a kind the window makes for itself (its background, its tool tip), from a
// description built here. A kind nobody registered is logged and gives null.
WidgetPtrT CreatePart(const core::CSettingsGroup& owner, const char* kind, const core::CSettingsGroup& node,
                      const core::CSettingsGroup& templates)
{
    if (!GetWidgetFactory().IsRegistered(kind)) {
        ReportElement(owner, "no widget kind for a part of the window, skipped: ", kind);
        return {};
    }
    return GetWidgetFactory().Create(kind, node, templates);
}

// `v` rounded up to a whole number of steps (a step of 0 leaves it).
int RoundUpToStep(int v, int step)
{
    return step == 0 || v % step == 0 ? v : (v / step + 1) * step;
}

} // namespace

// Loading -----------------------------------------------------------------------------------

void CWindow::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const std::string& tmplId = node.GetValue("window_template");
    const core::CSettingsGroup& tmpl =
        tmplId.empty() ? core::CSettingsGroup::Empty() : templates.GetChildByAttribute("window_template", "id", tmplId);
    if (!tmplId.empty() && &tmpl == &core::CSettingsGroup::Empty())
        ReportElement(node, "no such window_template, defaults used: ", tmplId);

    m_OpenSound = ReadSound(tmpl, "open_sound");
    m_CloseSound = ReadSound(tmpl, "close_sound");
    m_ShowEffect = core::ReadWString(tmpl, "show_effect");
    m_HideEffect = core::ReadWString(tmpl, "hide_effect");
    ReadChecked(tmpl, "tile_step_x", m_TileStepX, 0, kMaxTileStep);
    ReadChecked(tmpl, "tile_step_y", m_TileStepY, 0, kMaxTileStep);

    m_Hooks.SetLuaById(node.GetValue("lua"), DescribeElement(node));
    m_OnActionScript = node.GetValue("on_action_script");
    SetOverloadTable(node.GetValue("lua_overload_table"));

    if (const core::CSettingsGroup* insets = tmpl.GetChildRef("insets")) {
        misc::FloatInsets read;
        ReadInsets(*insets, read);
        SetInsets(read);
    }
    core::ReadBool(node, "moveable", m_Moveable);
    LoadTemplate(tmpl, templates);
    CBaseWindow::Load(node, templates);
}

void CWindow::LoadTemplate(const core::CSettingsGroup& tmpl, const core::CSettingsGroup& templates)
{
    const std::string& image = tmpl.GetValue("background");
    if (image.empty())
        return;
    core::CSettingsGroup description(misc::StringA88("image_widget"));
    description.AddValue("image", image.c_str());
    m_Background = CreatePart(tmpl, "image_widget", description, templates);
    if (!m_Background)
        return;
    LoadToolTip(tmpl, templates);
    m_Background->SetSize(GetSize().X, GetSize().Y);
    m_Background->SetAnchors(AnchorLeft | AnchorRight | AnchorTop | AnchorBottom);
    AddWidget(m_Background);
}

void CWindow::LoadToolTip(const core::CSettingsGroup& tmpl, const core::CSettingsGroup& templates)
{
    const std::string& labelTemplate = tmpl.GetValue("label_template");
    if (labelTemplate.empty())
        return;
    core::CSettingsGroup label(misc::StringA88("label_widget"));
    label.AddValue("label_template", labelTemplate.c_str());
    // The label's own words, from the template's keys for them.
    const std::pair<const char*, const char*> keys[] = {{"multi_string_flag", "multi_string_flag"},
                                                        {"justification", "label_justification"}};
    for (const auto& [name, key] : keys)
        if (tmpl.IsValue(key))
            label.AddValue(name, tmpl.GetValue(key).c_str());
    m_ToolTipLabel = CreatePart(tmpl, "label_widget", label, templates);
    if (m_ToolTipLabel && !dynamic_cast<ITextWidget*>(m_ToolTipLabel.get())) {
        ReportElement(tmpl, "the label_widget kind shows no text: the window shows no tool tips");
        m_ToolTipLabel.reset();
    }
    if (!m_ToolTipLabel)
        return;
    m_ToolTipLabel->AddFlags(FlagHidden);
    int width = 0;
    if (ReadChecked(tmpl, "label_width", width, 0, static_cast<int>(kMaxDescriptionSize)) && width > 0)
        m_ToolTipLabel->SetSize(static_cast<float>(width), m_ToolTipLabel->GetSize().Y);
    if (core::ReadColor(tmpl, "tool_tip_color", m_ToolTipColor))
        m_ToolTipLabel->SetColor(m_ToolTipColor);

    const std::string& image = tmpl.GetValue("tool_tip_background");
    if (!image.empty()) {
        core::CSettingsGroup background(misc::StringA88("image_widget"));
        background.AddValue("image", image.c_str());
        m_ToolTipBackground = CreatePart(tmpl, "image_widget", background, templates);
    }
    if (m_ToolTipBackground) {
        m_ToolTipBackground->SetFlags(m_ToolTipLabel->GetFlags());
        if (core::ReadColor(tmpl, "tool_tip_bkcolor", m_ToolTipBkColor))
            m_ToolTipBackground->SetColor(m_ToolTipBkColor);
    }
    const core::CSettingsGroup& insets = tmpl.GetChild("tool_tip_background_insets");
    const char* names[4] = {"left", "top", "right", "bottom"};
    for (int i = 0; i < 4; ++i)
        ReadChecked(insets, names[i], m_ToolTipInsets[i], 0, static_cast<int>(kMaxDescriptionSize));
}

void CWindow::SetSize(float width, float height)
{
    CBaseWindow::SetSize(width, height);
    if ((m_TileStepX == 0 && m_TileStepY == 0) || !m_Background)
        return;
    const misc::FloatInsets& in = m_Background->GetInsets();
    const int innerX = static_cast<int>(width - in.Left - in.Right);
    const int innerY = static_cast<int>(height - in.Top - in.Bottom);
    const int x = RoundUpToStep(innerX, m_TileStepX), y = RoundUpToStep(innerY, m_TileStepY);
    if (x != innerX || y != innerY)
        SetSize(static_cast<float>(x) + in.Left + in.Right, static_cast<float>(y) + in.Top + in.Bottom);
}

misc::FloatVector CWindow::GetPreferredSize() const
{
    if (const auto* image = dynamic_cast<const CImageWidget*>(m_Background.get()))
        return image->GetImage().GetTextureSize();
    return m_Background ? m_Background->GetPreferredSize() : FloatVector();
}

// Input -------------------------------------------------------------------------------------

bool CWindow::OnChar(wchar character, int keys, int rawKeyData, bool broadcast)
{
    if (m_Hooks.Has(HookOnChar))
        return m_Hooks.Call(HookOnChar, this, character, keys, rawKeyData, broadcast);
    return CBaseWindow::OnChar(character, keys, rawKeyData, broadcast);
}

bool CWindow::OnKeyDown(int key, int keys, int rawKeyData, bool broadcast)
{
    if (m_Hooks.Has(HookOnKeyDown))
        return m_Hooks.Call(HookOnKeyDown, this, key, keys, rawKeyData, broadcast);
    return CBaseWindow::OnKeyDown(key, keys, rawKeyData, broadcast);
}

bool CWindow::OnKeyUp(int key, int keys, int rawKeyData, bool broadcast)
{
    if (m_Hooks.Has(HookOnKeyUp))
        return m_Hooks.Call(HookOnKeyUp, this, key, keys, rawKeyData, broadcast);
    return CBaseWindow::OnKeyUp(key, keys, rawKeyData, broadcast);
}

bool CWindow::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    if (m_IsDragging) {
        // Both passes of a move arrive with the same point: the window moves once.
        if (!broadcast)
            Drag(pos);
        return true;
    }
    if (m_Hooks.Has(HookOnMouseMove))
        return m_Hooks.Call(HookOnMouseMove, this, pos.X, pos.Y, keys, broadcast);
    return CBaseWindow::OnMouseMove(pos, keys, broadcast);
}

bool CWindow::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    const bool handled = m_Hooks.Has(HookOnMouseDown)
                             ? m_Hooks.Call(HookOnMouseDown, this, pos.X, pos.Y, static_cast<int>(button), keys, broadcast)
                             : CBaseWindow::OnMouseDown(pos, button, keys, broadcast);
    if (!handled && !broadcast) {
        const FloatVector& size = GetSize();
        const bool inside = pos.X >= 0 && pos.Y >= 0 && pos.X < size.X && pos.Y < size.Y;
        m_IsDragging = inside && m_Moveable;
        m_DragStart = FloatVector(static_cast<float>(pos.X), static_cast<float>(pos.Y));
    }
    return handled;
}

bool CWindow::OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    m_IsDragging = false;
    if (m_Hooks.Has(HookOnMouseUp))
        return m_Hooks.Call(HookOnMouseUp, this, pos.X, pos.Y, static_cast<int>(button), keys, broadcast);
    return CBaseWindow::OnMouseUp(pos, button, keys, broadcast);
}

bool CWindow::OnDoubleClick(const IntVector& pos, int keys, bool broadcast)
{
    if (m_Hooks.Has(HookOnDoubleClick))
        return m_Hooks.Call(HookOnDoubleClick, this, pos.X, pos.Y, keys, broadcast);
    return CBaseWindow::OnDoubleClick(pos, keys, broadcast);
}

bool CWindow::OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    if (m_Hooks.Has(HookOnMouseWheel))
        return m_Hooks.Call(HookOnMouseWheel, this, pos.X, pos.Y, delta, keys, broadcast);
    return CBaseWindow::OnMouseWheel(pos, delta, keys, broadcast);
}

void CWindow::OnChildAction(const std::string& action, CWidget* sender)
{
    CBaseWindow::OnChildAction(action, sender);
    if (!m_Hooks.GetTable().empty()) {
        if (m_Hooks.Has(HookOnChildAction))
            m_Hooks.Call(HookOnChildAction, this, action.c_str(), sender);
    } else if (!m_OnActionScript.empty() && m_Hooks.GetLua()) {
        lua::CallLuaFunction(*m_Hooks.GetLua(), m_OnActionScript.c_str(), this, action.c_str(), sender);
    }
}

void CWindow::Drag(const IntVector& pos)
{
    const FloatVector to = GetOffset() + FloatVector(static_cast<float>(pos.X), static_cast<float>(pos.Y)) - m_DragStart;
    // The window stays whole on the canvas.
    const FloatVector parent = GetParentWindow() ? GetParentWindow()->GetAbsPos(true) : FloatVector();
    const FloatVector& canvas = GetGuiServices().canvas;
    const FloatVector& size = GetSize();
    const float x = std::max(0.0f, std::min(parent.X + to.X, canvas.X - size.X));
    const float y = std::max(0.0f, std::min(parent.Y + to.Y, canvas.Y - size.Y));
    SetOffset(x - parent.X, y - parent.Y);
}

bool CWindow::SuperOnChar(wchar character, int keys, int rawKeyData, bool broadcast)
{
    return CBaseWindow::OnChar(character, keys, rawKeyData, broadcast);
}

bool CWindow::SuperOnKeyDown(int key, int keys, int rawKeyData, bool broadcast)
{
    return CBaseWindow::OnKeyDown(key, keys, rawKeyData, broadcast);
}

bool CWindow::SuperOnKeyUp(int key, int keys, int rawKeyData, bool broadcast)
{
    return CBaseWindow::OnKeyUp(key, keys, rawKeyData, broadcast);
}

bool CWindow::SuperOnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    return CBaseWindow::OnMouseMove(pos, keys, broadcast);
}

bool CWindow::SuperOnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    return CBaseWindow::OnMouseDown(pos, button, keys, broadcast);
}

bool CWindow::SuperOnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    return CBaseWindow::OnMouseUp(pos, button, keys, broadcast);
}

bool CWindow::SuperOnDoubleClick(const IntVector& pos, int keys, bool broadcast)
{
    return CBaseWindow::OnDoubleClick(pos, keys, broadcast);
}

bool CWindow::SuperOnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    return CBaseWindow::OnMouseWheel(pos, delta, keys, broadcast);
}

void CWindow::SuperOnChildAction(const std::string& action, CWidget* sender)
{
    CBaseWindow::OnChildAction(action, sender);
}

// The frame, opening and closing -------------------------------------------------------------

void CWindow::DoDraw(graphics::CRenderer& renderer)
{
    if (m_Hooks.Has(HookDoDraw))
        m_Hooks.Call(HookDoDraw, this, &renderer);
    CBaseWindow::DoDraw(renderer);
    if (!IsToolTipShown())
        return;
    if (m_ToolTipBackground)
        m_ToolTipBackground->Draw(renderer);
    m_ToolTipLabel->Draw(renderer);
}

void CWindow::DoUpdate()
{
    if (m_Hooks.Has(HookDoUpdate))
        m_Hooks.Call(HookDoUpdate, this);
    FitToolTipBackground();
    CBaseWindow::DoUpdate();
}

void CWindow::OnOpen()
{
    PlayGuiSound(m_OpenSound);
    if (m_ShowEffect.empty())
        return;
    if (EffectPtrT effect = CreateGuiEffect(m_ShowEffect))
        AddEffect(effect);
    // A window shows its show effect at its first opening only.
    m_ShowEffect.clear();
}

bool CWindow::OnClose()
{
    PlayGuiSound(m_CloseSound);
    if (!m_HideEffect.empty()) {
        if (EffectPtrT effect = CreateGuiEffect(m_HideEffect)) {
            AddEffect(effect);
            m_HideEffect.clear();
        }
    }
    return true;
}

// Tool tips -----------------------------------------------------------------------------------

bool CWindow::IsToolTipShown() const { return m_ToolTipLabel && !(m_ToolTipLabel->GetFlags() & FlagHidden); }

void CWindow::HideToolTip()
{
    if (m_ToolTipLabel)
        m_ToolTipLabel->AddFlags(FlagHidden);
}

void CWindow::FitToolTipBackground()
{
    if (!m_ToolTipLabel || !m_ToolTipBackground)
        return;
    const FloatVector& at = m_ToolTipLabel->GetOffset();
    const FloatVector& size = m_ToolTipLabel->GetSize();
    const float left = static_cast<float>(m_ToolTipInsets[0]), top = static_cast<float>(m_ToolTipInsets[1]);
    const float right = static_cast<float>(m_ToolTipInsets[2]), bottom = static_cast<float>(m_ToolTipInsets[3]);
    m_ToolTipBackground->SetOffset(at.X - left, at.Y - top);
    const FloatVector grown(size.X + left + right, size.Y + top + bottom);
    if (!(grown == m_ToolTipBackground->GetSize()))
        m_ToolTipBackground->SetSize(grown.X, grown.Y);
}

void CWindow::ShowToolTip(const FloatVector& position, const wstring& text)
{
    auto* label = dynamic_cast<ITextWidget*>(m_ToolTipLabel.get());
    if (!label)
        return;
    label->SetText(text);
    m_ToolTipLabel->SetFlags(0);
    label->ResizeToFitText();
    const FloatVector& size = m_ToolTipLabel->GetSize();
    m_ToolTipLabel->SetOffset(position.X - size.X / 2, position.Y);
    FitToolTipBackground();

    // The whole tip stays inside the window: its far edges are pulled back, then its near
    // edges are kept from going below 0.
    const CWidget& outer = m_ToolTipBackground ? *m_ToolTipBackground : *m_ToolTipLabel;
    auto keepInside = [](float at, float extent, float room) {
        return std::max(std::min(0.0f, room - (at + extent)), -at);
    };
    const FloatVector shift(keepInside(outer.GetOffset().X, outer.GetSize().X, GetSize().X),
                            keepInside(outer.GetOffset().Y, outer.GetSize().Y, GetSize().Y));
    const FloatVector moved = m_ToolTipLabel->GetOffset() + shift;
    m_ToolTipLabel->SetOffset(moved.X, moved.Y);
    FitToolTipBackground();
}

} // namespace ox::gui
