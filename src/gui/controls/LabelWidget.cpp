#include "gui/controls/LabelWidget.h"

#include "core/SettingsReaders.h"
#include "graphics/Renderer.h"
#include "graphics/TextRender.h"
#include "gui/Description.h"
#include "gui/controls/ControlSupport.h"

#include <algorithm>
#include <cmath>

namespace ox::gui {

namespace {

using R = graphics::CRenderer;
constexpr unsigned kHorizontal = R::TextLeft | R::TextCenterH | R::TextRight;
constexpr unsigned kVertical = R::TextTop | R::TextCenterV | R::TextBottom;

// Measuring needs no renderer: one text walker serves every label.
graphics::CTextRender& Measurer()
{
    static auto* render = new graphics::CTextRender();
    return *render;
}

} // namespace

void CLabelWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "label_template");
    m_Font = ReadFont(tmpl, "font");
    bool flag = false;
    if (ReadFlag(tmpl, "label_underline", flag) && flag)
        m_TextFlags |= R::TextUnderline;
    core::ReadLocalText(node, "text", m_Text);
    if (ReadFlag(node, "multi_string_flag", flag))
        SetWordBreak(flag);
    if (node.IsValue("justification"))
        m_TextFlags = (m_TextFlags & ~(kHorizontal | kVertical)) | ParseJustification(node.GetValue("justification"));
    float scale = 0;
    if (ReadChecked(node, "label_font_scale", scale, 0.0f, 100.0f) && scale > 0.001f)
        SetFontScale(scale);
    CWidget::Load(node, templates);
    ResizeToFitText(false);
}

misc::FloatVector CLabelWidget::GetPreferredSize() const
{
    if (!m_Font)
        return {};
    const misc::FloatInsets& in = GetInsets();
    const float innerWidth = std::max(0.0f, GetSize().X - in.Left - in.Right) / m_FontScale;
    const float innerHeight = std::max(0.0f, GetSize().Y - in.Top - in.Bottom) / m_FontScale;
    misc::IntVector size;
    const misc::IntRect box(0, 0, static_cast<int>(innerWidth), static_cast<int>(innerHeight));
    if (!Measurer().GetTextSize(m_Font, m_Text.c_str(), box, m_TextFlags, 0, size))
        return {};
    return {static_cast<float>(size.X) * m_FontScale + in.Left + in.Right,
            static_cast<float>(size.Y) * m_FontScale + in.Top + in.Bottom};
}

void CLabelWidget::ResizeToFitText(bool fitExact)
{
    FloatVector size = GetPreferredSize();
    if (!fitExact)
        size = {std::max(size.X, GetSize().X), std::max(size.Y, GetSize().Y)};
    SetSize(size.X, size.Y);
}

void CLabelWidget::SetJustifications(int horizontal, int vertical)
{
    const unsigned h = horizontal < 0 ? R::TextLeft : (horizontal > 0 ? R::TextRight : R::TextCenterH);
    const unsigned v = vertical < 0 ? R::TextTop : (vertical > 0 ? R::TextBottom : R::TextCenterV);
    m_TextFlags = (m_TextFlags & ~(kHorizontal | kVertical)) | h | v;
}

void CLabelWidget::SetFontScale(float scale) { m_FontScale = std::clamp(scale, 0.1f, 100.0f); }

void CLabelWidget::SetWordBreak(bool on)
{
    m_TextFlags = on ? (m_TextFlags | R::TextWordWrap) : (m_TextFlags & ~static_cast<unsigned>(R::TextWordWrap));
}

void CLabelWidget::DoDraw(graphics::CRenderer& renderer)
{
    CWidget::DoDraw(renderer);
    if (!m_Font || m_Text.empty())
        return;
    const misc::FloatInsets& in = GetInsets();
    const float width = (GetSize().X - in.Left - in.Right) / m_FontScale;
    const float height = (GetSize().Y - in.Top - in.Bottom) / m_FontScale;
    if (width <= 0 || height <= 0)
        return;
    renderer.PushState();
    renderer.ApplyMatrix(misc::MatrixScale(m_FontScale, m_FontScale) * misc::MatrixTranslation(in.Left, in.Top));
    renderer.RenderText(*m_Font, m_Text, misc::IntRect(0, 0, static_cast<int>(std::ceil(width)),
                                                       static_cast<int>(std::ceil(height))),
                        m_TextFlags);
    renderer.PopState();
}

} // namespace ox::gui
