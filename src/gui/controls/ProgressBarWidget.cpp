#include "gui/controls/ProgressBarWidget.h"

#include "gui/Description.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/ImageWidget.h"

#include <algorithm>
#include <cmath>

namespace ox::gui {

namespace {

// The bar: clipped to its own (partial) width, its image drawn over the whole bar's width.
class CBarImage : public CImageWidget {
public:
    void SetFullWidth(float width)
    {
        m_FullWidth = width;
        PlaceImage();
    }

protected:
    void PlaceImage() override { SetImageRect(misc::FloatRect(0, 0, m_FullWidth, GetSize().Y)); }

private:
    float m_FullWidth = 0;
};

} // namespace

CProgressBarWidget::CProgressBarWidget() : m_Frame(new CImageWidget()), m_Bar(new CBarImage())
{
    m_Bar->AddFlags(FlagClipDraw);
    AddWidget(m_Frame);
    AddWidget(m_Bar);
}

CImageWidget* CProgressBarWidget::GetFrame() const { return static_cast<CImageWidget*>(m_Frame.get()); }
CImageWidget* CProgressBarWidget::GetBar() const { return static_cast<CImageWidget*>(m_Bar.get()); }

void CProgressBarWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    ReadImage(node, "frame", GetFrame()->GetImage());
    ReadImage(node, "progress", GetBar()->GetImage());
    float value = m_Value;
    ReadChecked(node, "value", value, 0.0f, 1.0f);
    CWidget::Load(node, templates);
    const FloatVector frame = GetFrame()->GetImage().GetTextureSize();
    TakeNaturalSize(*this, frame.X > 0 ? frame : GetBar()->GetImage().GetTextureSize());
    SetValue(value);
}

void CProgressBarWidget::SetImages(const char* frame, const char* bar)
{
    GetFrame()->SetImage(frame);
    GetBar()->SetImage(bar);
    PlaceBar();
}

void CProgressBarWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    m_Frame->SetSize(width, height);
    PlaceBar();
}

void CProgressBarWidget::SetValue(float value)
{
    m_Value = std::clamp(value, 0.0f, 1.0f);
    PlaceBar();
}

void CProgressBarWidget::PlaceBar()
{
    auto* bar = static_cast<CBarImage*>(m_Bar.get());
    bar->SetSize(m_Value * GetSize().X, GetSize().Y);
    bar->SetFullWidth(GetSize().X);
}

} // namespace ox::gui
