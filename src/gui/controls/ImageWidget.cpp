#include "gui/controls/ImageWidget.h"

#include "gui/controls/ControlSupport.h"

#include <algorithm>

namespace ox::gui {

CImageWidget::CImageWidget() { AddFlags(FlagDisabled); }

void CImageWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    ReadImage(node, "image", m_Image);
    CWidget::Load(node, templates);
    TakeNaturalSize(*this, m_Image.GetTextureSize());
    PlaceImage();
}

void CImageWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    PlaceImage();
}

misc::FloatVector CImageWidget::GetPreferredSize() const
{
    return m_StretchType == StretchNo ? m_Image.GetTextureSize() : FloatVector();
}

void CImageWidget::SetImage(const char* id)
{
    m_Image.Init();
    m_Image.SetTexture(id ? id : "");
    PlaceImage();
}

void CImageWidget::SetImage(const graphics::CTexture* texture)
{
    m_Image.Init(texture);
    PlaceImage();
}

void CImageWidget::SetStretchType(int type)
{
    m_StretchType = std::clamp(type, static_cast<int>(StretchMaximum), static_cast<int>(StretchNo));
    PlaceImage();
}

void CImageWidget::PlaceImage()
{
    const FloatVector image = m_Image.GetTextureSize();
    const float w = GetSize().X, h = GetSize().Y;
    auto centred = [&](float iw, float ih) { return misc::FloatRect((w - iw) / 2, (h - ih) / 2, iw, ih); };
    const bool fits = image.X <= w && image.Y <= h;
    const bool empty = image.X == 0 || image.Y == 0;
    switch (m_StretchType) {
    case StretchMaximum:
        m_ImageRect = misc::FloatRect(0, 0, w, h);
        return;
    case StretchOnlyDecrease:
        if (fits || empty) {
            m_ImageRect = centred(image.X, image.Y);
            return;
        }
        [[fallthrough]];
    case StretchProportional:
        if (!empty) {
            const float s = std::min(w / image.X, h / image.Y);
            m_ImageRect = centred(s * image.X, s * image.Y);
            return;
        }
        [[fallthrough]];
    default:
        m_ImageRect = centred(image.X, image.Y);
    }
}

void CImageWidget::DoDraw(graphics::CRenderer& renderer)
{
    if (m_Image.HasTexture() && m_ImageRect.Width > 0 && m_ImageRect.Height > 0)
        m_Image.Draw(renderer, m_ImageRect);
    CWidget::DoDraw(renderer);
}

} // namespace ox::gui
