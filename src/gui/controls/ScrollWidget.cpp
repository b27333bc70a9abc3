#include "gui/controls/ScrollWidget.h"

#include "gui/Description.h"
#include "gui/GuiServices.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/ImageWidget.h"

#include <boost/make_shared.hpp>

#include <algorithm>
#include <cmath>

namespace ox::gui {

namespace {

constexpr float kMaxValue = 1.0e9f;

// A button with the four state images of a declared texture and no sounds or label: it is
// loaded from a description of its own that names only the image.
void SetButtonImage(CButtonWidget& button, const char* texture)
{
    core::CSettingsGroup templates(misc::StringA88("GUITemplates"));
    auto tmpl = boost::make_shared<core::CSettingsGroup>(misc::StringA88("button_template"));
    tmpl->AddValue("id", "part");
    tmpl->AddValue("image", texture ? texture : "");
    templates.AddChild(tmpl);
    core::CSettingsGroup node(misc::StringA88("button_widget"));
    node.AddValue("button_template", "part");
    button.Load(node, templates);
    const misc::FloatVector preferred = button.GetPreferredSize();
    button.SetSize(preferred.X, preferred.Y);
}

// A texture id the template names, checked: one that isn't declared is logged and left out.
std::string CheckedImage(const core::CSettingsGroup& tmpl, const char* key)
{
    graphics::CImage image;
    return ReadImage(tmpl, key, image) ? tmpl.GetValue(key) : std::string();
}

bool IsPressed(const WidgetPtrT& button)
{
    return static_cast<const CButtonWidget&>(*button).GetButtonState() == CButtonWidget::StatePressed;
}

} // namespace

CScrollWidget::CScrollWidget(bool vertical)
    : CWidget({}, LayerTop, BroadcastOnMouseMove | BroadcastOnMouseUp), m_Back(new CImageWidget()),
      m_Top(new CButtonWidget()), m_Bottom(new CButtonWidget()), m_Thumb(new CButtonWidget()), m_Vertical(vertical)
{
    AddWidget(m_Back);
    AddWidget(m_Top);
    AddWidget(m_Bottom);
    AddWidget(m_Thumb);
    SetImages("", "", "", "");
}

CScrollWidget::~CScrollWidget() = default;

CButtonWidget* CScrollWidget::GetThumb() const { return static_cast<CButtonWidget*>(m_Thumb.get()); }
CButtonWidget* CScrollWidget::GetTopButton() const { return static_cast<CButtonWidget*>(m_Top.get()); }
CButtonWidget* CScrollWidget::GetBottomButton() const { return static_cast<CButtonWidget*>(m_Bottom.get()); }
CImageWidget* CScrollWidget::GetBar() const { return static_cast<CImageWidget*>(m_Back.get()); }

void CScrollWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "scroll_template");
    m_SoundOnDragAndDrop = ReadSound(tmpl, "sound_on_drag_and_drop");
    m_SoundOnButtonPress = ReadSound(tmpl, "sound_on_button_press");
    m_SoundOnSetValue = ReadSound(tmpl, "sound_on_set_value");
    ReadFlag(tmpl, "vertical", m_Vertical);
    SetImages(CheckedImage(tmpl, "thumb_image").c_str(), CheckedImage(tmpl, "back_image").c_str(),
              CheckedImage(tmpl, "top_image").c_str(), CheckedImage(tmpl, "bottom_image").c_str());
    CWidget::Load(node, templates);
    TakeNaturalSize(*this, GetPreferredSize());
    float value = 0;
    if (ReadChecked(node, "max_value", value, 0.0f, kMaxValue))
        SetMaxValue(value);
    if (ReadChecked(node, "page_size", value, 0.0f, kMaxValue))
        SetPageSize(value);
    if (ReadChecked(node, "value", value, 0.0f, kMaxValue))
        SetValue(value);
    ReadChecked(node, "mouse_wheel_k", m_MouseWheelK, -kMaxValue, kMaxValue);
}

void CScrollWidget::SetImages(const char* thumb, const char* back, const char* top, const char* bottom)
{
    SetButtonImage(*GetThumb(), thumb);
    SetButtonImage(*GetTopButton(), top);
    SetButtonImage(*GetBottomButton(), bottom);
    GetBar()->SetImage(back);
    GetBar()->GetImage().SetFlags(graphics::CImage::FlagBoxImage | graphics::CImage::FlagIntDest);
    m_Back->SetAnchors(m_Vertical ? AnchorTop | AnchorBottom : AnchorLeft | AnchorRight);
    m_Top->SetAnchors(m_Vertical ? AnchorTop : AnchorLeft);
    m_Bottom->SetAnchors(m_Vertical ? AnchorBottom : AnchorRight);
    const FloatVector preferred = GetPreferredSize();
    CWidget::SetSize(preferred.X, preferred.Y);
    Arrange();
}

// Layout ------------------------------------------------------------------------------------

misc::FloatVector CScrollWidget::GetPreferredSize() const
{
    const FloatVector top = m_Top->GetPreferredSize(), bottom = m_Bottom->GetPreferredSize();
    const FloatVector thumb = m_Thumb->GetPreferredSize(), bar = GetBar()->GetImage().GetTextureSize();
    return Make(std::max(Along(bar), Along(thumb)) + Along(top) + Along(bottom),
                std::max({Across(top), Across(bottom), Across(bar)}));
}

void CScrollWidget::SetSize(float width, float height)
{
    const FloatVector size = GetSize();
    if (m_Vertical && size.X != 0)
        width = size.X;
    else if (!m_Vertical && size.Y != 0)
        height = size.Y;
    CWidget::SetSize(width, height);
    Arrange();
}

void CScrollWidget::Arrange()
{
    const float length = Along(GetSize()), across = Across(GetSize());
    const FloatVector top = m_Top->GetSize(), bottom = m_Bottom->GetSize();
    auto centred = [&](const FloatVector& part) { return std::floor((across - Across(part)) / 2); };
    const FloatVector topAt = Make(0, centred(top)), bottomAt = Make(length - Along(bottom), centred(bottom));
    m_Top->SetOffset(topAt.X, topAt.Y);
    m_Bottom->SetOffset(bottomAt.X, bottomAt.Y);
    const FloatVector barAt = Make(Along(top), 0);
    const FloatVector barSize = Make(std::max(0.0f, length - Along(top) - Along(bottom)), across);
    m_Back->SetOffset(barAt.X, barAt.Y);
    m_Back->SetSize(barSize.X, barSize.Y);
    const FloatVector thumbAt = Make(Along(m_Thumb->GetOffset()), centred(m_Thumb->GetSize()));
    m_Thumb->SetOffset(thumbAt.X, thumbAt.Y);
    FitThumb();
}

void CScrollWidget::FitThumb()
{
    const float length = std::ceil(Along(m_Back->GetSize()) * (m_PageSize / m_MaxValue));
    const FloatVector size = Make(length, Across(m_Thumb->GetSize()));
    m_Thumb->SetSize(size.X, size.Y);
    PlaceThumb();
}

void CScrollWidget::PlaceThumb()
{
    const float along = Along(m_Back->GetOffset()) + Along(m_Back->GetSize()) * (m_Value / m_MaxValue);
    const FloatVector at = Make(along, Across(m_Thumb->GetOffset()));
    m_Thumb->SetOffset(at.X, at.Y);
}

// Values --------------------------------------------------------------------------------------

float CScrollWidget::Clamped(float value) const
{
    return std::clamp(std::isnan(value) ? 0.0f : value, 0.0f, std::max(0.0f, m_MaxValue - m_PageSize));
}

void CScrollWidget::SetValue(float value)
{
    m_Value = Clamped(value);
    PlaceThumb();
    OnValueChanged();
}

void CScrollWidget::OnValueChanged() { TellParent(*this, "value_changed"); }

// A smaller whole or a larger page would leave the value beyond its range: it is brought
// back without telling anyone, as the value scaled with the whole isn't told either.
void CScrollWidget::SetMaxValue(float value)
{
    value = std::max(std::isnan(value) ? 0.0f : value, 1.0f);
    m_Value *= value / m_MaxValue;
    m_MaxValue = value;
    m_PageSize = std::min(m_PageSize, m_MaxValue);
    m_Value = Clamped(m_Value);
    FitThumb();
}

void CScrollWidget::SetPageSize(float value)
{
    m_PageSize = std::min(std::max(std::isnan(value) ? 0.0f : value, 1.0f), m_MaxValue);
    m_Value = Clamped(m_Value);
    FitThumb();
}

// Input ---------------------------------------------------------------------------------------

bool CScrollWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    const bool taken = CWidget::OnMouseDown(pos, button, keys, broadcast);
    if (broadcast)
        return taken;
    const FloatVector point(static_cast<float>(pos.X), static_cast<float>(pos.Y));
    if (!taken) {
        if (!m_Back->ContainsPoint(point))
            return false;
        PlayGuiSound(m_SoundOnSetValue);
        SetValue(Along(point) > Along(m_Thumb->GetOffset()) ? m_Value + m_PageSize : m_Value - m_PageSize);
        return true;
    }
    if (button != RightButton && IsPressed(m_Thumb)) {
        PlayGuiSound(m_SoundOnDragAndDrop);
        m_DragOffset = Along(point) - Along(m_Thumb->GetOffset());
    }
    return true;
}

// A move reaches the scroll in both passes while the pointer is over it: the value is set
// (and told) only when the move changes it.
bool CScrollWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    CWidget::OnMouseMove(pos, keys, broadcast);
    if (!IsPressed(m_Thumb))
        return false;
    const float bar = Along(m_Back->GetSize()), thumb = Along(m_Thumb->GetSize());
    if (std::fabs(bar - thumb) < 0.01f)
        return false;
    const FloatVector point(static_cast<float>(pos.X), static_cast<float>(pos.Y));
    const float value =
        (Along(point) - m_DragOffset - Along(m_Back->GetOffset())) * (m_MaxValue - m_PageSize) / (bar - thumb);
    if (Clamped(value) != m_Value)
        SetValue(value);
    return true;
}

bool CScrollWidget::OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    const bool top = IsPressed(m_Top), bottom = IsPressed(m_Bottom), thumb = IsPressed(m_Thumb);
    if (!CWidget::OnMouseUp(pos, button, keys, broadcast))
        return false;
    if (top && !IsPressed(m_Top)) {
        PlayGuiSound(m_SoundOnButtonPress);
        SetValue(m_Value - m_ButtonValue);
    }
    if (bottom && !IsPressed(m_Bottom)) {
        PlayGuiSound(m_SoundOnButtonPress);
        SetValue(m_Value + m_ButtonValue);
    }
    if (thumb && !IsPressed(m_Thumb))
        PlayGuiSound(m_SoundOnDragAndDrop);
    return true;
}

bool CScrollWidget::OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    if (CWidget::OnMouseWheel(pos, delta, keys, broadcast))
        return true;
    SetValue(m_Value - static_cast<float>(delta) * m_MouseWheelK);
    return true;
}

} // namespace ox::gui
