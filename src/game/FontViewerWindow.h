#pragma once
// A tool for game makers judging fonts: a combo box of the declared fonts (combobox_fonts),
// a text box (edit_text) and a label (label_text) that shows the typed text in the chosen
// font. The fonts' files are watched: a font file saved again is read again, and a label in
// that font is built anew. Escape closes the window. Its layout is game data: a window
// description with those three children.
#include "gui/Window.h"
#include "misc/FileWatcher.h"

#include <vector>

namespace mluabind {
class Namespace;
}

namespace ox::core {
class FontDeclaration;
}

namespace k17 {

class CFontViewerWindow : public ox::gui::CWindow {
public:
    // Takes the font declarations of the application and watches their files.
    CFontViewerWindow();
    ~CFontViewerWindow() override;

    // The description, then the combo box filled with the fonts' ids and its first line chosen.
    void Load(const ox::core::CSettingsGroup& node, const ox::core::CSettingsGroup& templates) override;
    void OnChildAction(const std::string& action, ox::gui::CWidget* sender) override;
    // Reads changed font files again.
    void DoUpdate() override;
    bool OnKeyDown(int key, int keys, int rawKeyData, bool broadcast) override;

    size_t GetFontCount() const { return m_Fonts.size(); }

private:
    const ox::core::FontDeclaration* SelectedFont() const;
    // The old label goes; a new one in the chosen font shows the typed text 10 below the box.
    void RebuildLabel();
    void Close();

    std::vector<const ox::core::FontDeclaration*> m_Fonts;
    ox::misc::CFileWatcher m_Watcher;
};

// k17.CFontViewerWindow and its pointer class.
void BindFontViewer(mluabind::Namespace& ns);

} // namespace k17
