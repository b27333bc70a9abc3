#include "gui/controls/ImageBoxWidget.h"

#include "graphics/Renderer.h"
#include "gui/Description.h"
#include "gui/controls/ControlSupport.h"

#include <algorithm>

namespace ox::gui {

void CImageBoxWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "imagebox_template");
    if (const core::CSettingsGroup* insets = tmpl.GetChildRef("insets")) {
        misc::FloatInsets read;
        ReadInsets(*insets, read);
        SetInsets(read);
    }
    ReadImage(tmpl, "frame_image", m_Frame);
    m_Frame.SetFlags(graphics::CImage::FlagBoxImage);
    ReadImage(node, "image", m_Content);
    const std::string& stretch = node.GetValue("stretch");
    const char* names[] = {"no", "fit", "width", "height", "fill"};
    const auto found = std::find(std::begin(names), std::end(names), stretch);
    if (found != std::end(names))
        m_Stretch = static_cast<int>(found - std::begin(names));
    else if (!stretch.empty())
        ReportElement(node, "stretch is none of no, fit, width, height, fill; fit is used: ", stretch);
    CWidget::Load(node, templates);
}

misc::FloatRect CImageBoxWidget::GetContentRect() const
{
    const misc::FloatInsets& in = GetInsets();
    const float w = std::max(0.0f, GetSize().X - in.Left - in.Right), h = std::max(0.0f, GetSize().Y - in.Top - in.Bottom);
    const FloatVector image = m_Content.GetTextureSize();
    float scale = 1;
    if (image.X > 0 && image.Y > 0) {
        const float sx = w / image.X, sy = h / image.Y;
        const float scales[] = {1, std::min(sx, sy), sx, sy, std::max(sx, sy)};
        scale = scales[std::clamp(m_Stretch, 0, 4)];
    }
    const float cw = image.X * scale, ch = image.Y * scale;
    return {in.Left + (w - cw) / 2, in.Top + (h - ch) / 2, cw, ch};
}

void CImageBoxWidget::DoDraw(graphics::CRenderer& renderer)
{
    if (m_Content.HasTexture()) {
        const misc::FloatInsets& in = GetInsets();
        renderer.PushState();
        renderer.SetClipPoly(misc::RectToPoly4(
            {in.Left, in.Top, GetSize().X - in.Left - in.Right, GetSize().Y - in.Top - in.Bottom}));
        m_Content.Draw(renderer, GetContentRect());
        renderer.PopState();
    }
    m_Frame.Draw(renderer, misc::FloatRect(0, 0, GetSize().X, GetSize().Y));
    CWidget::DoDraw(renderer);
}

bool CImageBoxWidget::OnMouseDown(const IntVector& /*pos*/, MouseButtons /*button*/, int /*keys*/, bool broadcast)
{
    if (broadcast)
        return false;
    TellParent(*this, "on_mouse_down");
    return true;
}

} // namespace ox::gui
