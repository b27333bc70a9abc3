#pragma once
// A text in a font, in the widget's rectangle less its insets: justified by words, on one
// line or broken at words, underlined, scaled. Its look comes from a label_template (font,
// underline), its text and layout from its element.
#include "gui/TextWidget.h"
#include "gui/Widget.h"

namespace ox::graphics {
struct CFont;
}

namespace ox::gui {

class CLabelWidget : public CWidget, public ITextWidget {
public:
    CLabelWidget() = default;

    // The template's font and underline; the element's text, multi_string_flag,
    // justification and label_font_scale; then the widget's own reading; the size grows to
    // fit the text.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    // The text's measured size in the inner width, plus the insets; (0, 0) without a font.
    FloatVector GetPreferredSize() const override;
    // The children, then the text in the colour of the renderer's state.
    void DoDraw(graphics::CRenderer& renderer) override;

    void SetText(const wstring& text) override { m_Text = text; }
    const wstring& GetText() const { return m_Text; }
    // The preferred size; unless `fitExact`, no axis shrinks below the present size.
    void ResizeToFitText(bool fitExact);
    void ResizeToFitText() override { ResizeToFitText(true); }
    // By the Justify values (-1, 0, 1 on each axis).
    void SetJustifications(int horizontal, int vertical);
    // Clamped to 0.1 .. 100.
    void SetFontScale(float scale);
    float GetFontScale() const { return m_FontScale; }
    void SetWordBreak(bool on);
    void SetFont(const graphics::CFont* font) { m_Font = font; }
    const graphics::CFont* GetFont() const { return m_Font; }
    // The text flags the text is drawn and measured with.
    unsigned GetTextFlags() const { return m_TextFlags; }

private:
    const graphics::CFont* m_Font = nullptr;
    wstring m_Text;
    unsigned m_TextFlags = 0;
    float m_FontScale = 1.0f;
};

} // namespace ox::gui
