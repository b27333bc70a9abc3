#include "gui/controls/SliderWidget.h"

#include "gui/Description.h"
#include "gui/GuiServices.h"
#include "gui/controls/ControlSupport.h"

#include <algorithm>
#include <cmath>

namespace ox::gui {

CSliderWidget::CSliderWidget()
    : CWidget({}, LayerTop, BroadcastOnMouseMove | BroadcastOnMouseUp), m_Bar(new CImageWidget()),
      m_Thumb(new CImageWidget())
{
    m_Bar->SetAnchors(AnchorLeft | AnchorRight | AnchorTop | AnchorBottom);
    m_Thumb->SetAnchors(AnchorLeft | AnchorTop);
    AddWidget(m_Bar);
    AddWidget(m_Thumb);
}

CImageWidget* CSliderWidget::GetThumb() const { return static_cast<CImageWidget*>(m_Thumb.get()); }
CImageWidget* CSliderWidget::GetBar() const { return static_cast<CImageWidget*>(m_Bar.get()); }

void CSliderWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "slider_template");
    m_Sound = ReadSound(tmpl, "sound");
    if (const core::CSettingsGroup* insets = tmpl.GetChildRef(misc::StringA88("insets"))) {
        misc::FloatInsets read;
        ReadInsets(*insets, read);
        SetInsets(read);
    }
    ReadImage(tmpl, "slider_image", GetBar()->GetImage());
    ReadImage(tmpl, "thumb_image", GetThumb()->GetImage());
    SetImages(nullptr, nullptr);
    CWidget::Load(node, templates);
    float value = m_Value;
    ReadChecked(node, "value", value, 0.0f, 1.0f);
    SetValue(value, false);
}

void CSliderWidget::SetImages(const char* thumb, const char* bar)
{
    if (thumb)
        GetThumb()->SetImage(thumb);
    if (bar)
        GetBar()->SetImage(bar);
    GetBar()->GetImage().SetFlags(graphics::CImage::FlagBoxImage | graphics::CImage::FlagIntDest);
    GetThumb()->GetImage().SetFlags(graphics::CImage::FlagIntDest);
    const FloatVector thumbSize = GetThumb()->GetImage().GetTextureSize();
    m_Thumb->SetSize(thumbSize.X, thumbSize.Y);
    const FloatVector preferred = GetPreferredSize();
    CWidget::SetSize(preferred.X, preferred.Y);
    Arrange();
}

misc::FloatVector CSliderWidget::GetPreferredSize() const
{
    const FloatVector bar = GetBar()->GetImage().GetTextureSize(), thumb = GetThumb()->GetImage().GetTextureSize();
    return {bar.X, std::max(bar.Y, thumb.Y)};
}

void CSliderWidget::SetSize(float width, float /*height*/)
{
    CWidget::SetSize(width, GetPreferredSize().Y);
    Arrange();
}

void CSliderWidget::Arrange()
{
    const float height = GetSize().Y, bar = GetBar()->GetImage().GetTextureSize().Y;
    m_Bar->SetOffset(0, std::floor((height - bar) / 2));
    m_Bar->SetSize(GetSize().X, bar);
    m_Thumb->SetOffset(m_Thumb->GetOffset().X, std::floor((height - m_Thumb->GetSize().Y) / 2));
    PlaceThumb();
}

void CSliderWidget::PlaceThumb()
{
    const misc::FloatInsets& in = GetInsets();
    const float span = GetSize().X - in.Left - in.Right - m_Thumb->GetSize().X;
    m_Thumb->SetOffset(in.Left + span * m_Value, m_Thumb->GetOffset().Y);
}

void CSliderWidget::SetValue(float value, bool notify)
{
    m_Value = std::clamp(std::isnan(value) ? 0.0f : value, 0.0f, 1.0f);
    PlaceThumb();
    if (notify)
        OnValueChanged();
}

void CSliderWidget::OnValueChanged() { TellParent(*this, "value_changed"); }

// Input ---------------------------------------------------------------------------------------

// The pointer reaches the slider in both passes while it is over it: the parent hears of a
// value only when the pointer changes it.
void CSliderWidget::MoveTo(int x)
{
    const misc::FloatInsets& in = GetInsets();
    const float thumb = m_Thumb->GetSize().X, span = GetSize().X - in.Left - in.Right - thumb;
    const float p = std::clamp(static_cast<float>(x) - in.Left - thumb / 2, 0.0f, std::max(0.0f, span));
    const float value = span > 0 ? p / span : 0.0f;
    if (value != m_Value)
        SetValue(value, true);
}

bool CSliderWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    if (CWidget::OnMouseDown(pos, button, keys, broadcast))
        return true;
    const FloatVector point(static_cast<float>(pos.X), static_cast<float>(pos.Y));
    if (m_Thumb->ContainsPoint(point)) {
        m_Dragging = true;
        PlayGuiSound(m_Sound);
        return true;
    }
    const misc::FloatRect bar(0, m_Bar->GetOffset().Y, GetSize().X, GetSize().Y);
    if (point.X >= bar.X && point.Y >= bar.Y && point.X < bar.X + bar.Width && point.Y < bar.Y + bar.Height) {
        MoveTo(pos.X);
        PlayGuiSound(m_Sound);
        return true;
    }
    return false;
}

bool CSliderWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    CWidget::OnMouseMove(pos, keys, broadcast);
    if (m_Dragging)
        MoveTo(pos.X);
    return m_Dragging;
}

bool CSliderWidget::OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    CWidget::OnMouseUp(pos, button, keys, broadcast);
    const bool was = m_Dragging;
    if (was) {
        MoveTo(pos.X);
        PlayGuiSound(m_Sound);
    }
    m_Dragging = false;
    return was;
}

bool CThumbWidget::OnMouseDown(const IntVector& /*pos*/, MouseButtons /*button*/, int /*keys*/, bool /*broadcast*/)
{
    if (GetParentWidget())
        TellParent(*this, "selected");
    return true;
}

} // namespace ox::gui
