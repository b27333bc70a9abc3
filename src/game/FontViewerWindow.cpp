#include "game/FontViewerWindow.h"

#include "core/Application.h"
#include "core/FontManager.h"
#include "gui/controls/ComboBoxWidget.h"
#include "gui/controls/EditWidget.h"
#include "gui/controls/LabelWidget.h"
#include "gui/WidgetManager.h"
#include "lua/mluabind/StdBinding.h"
#include "misc/Unicode.h"

#include <algorithm>

namespace k17 {

using namespace ox;

namespace {

constexpr unsigned kWatchPeriod = 1000; // milliseconds between two reads of a file's time
constexpr float kLabelGap = 10.0f;

void CollectFonts(const core::ResourceGroup& group, std::vector<const core::FontDeclaration*>& fonts)
{
    for (const auto& child : group.m_Groups)
        CollectFonts(*child, fonts);
    for (const core::FontDeclaration& font : group.m_Declarations)
        fonts.push_back(&font);
}

} // namespace

CFontViewerWindow::CFontViewerWindow() : m_Watcher(false, kWatchPeriod)
{
    OX_CHECK_DATA(core::g_Application != nullptr);
    CollectFonts(core::g_Application->GetResourceDeclarations(), m_Fonts);
    for (const core::FontDeclaration* font : m_Fonts)
        if (!font->file.empty())
            m_Watcher.WatchFile(misc::Utf8ToWide(font->file), false);
}

CFontViewerWindow::~CFontViewerWindow() = default;

void CFontViewerWindow::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    CWindow::Load(node, templates);
    auto* fonts = dynamic_cast<gui::CComboBoxWidget*>(GetWidget("combobox_fonts", true));
    OX_CHECK_DATA(fonts != nullptr);
    for (const core::FontDeclaration* font : m_Fonts)
        fonts->AddLine(misc::Utf8ToWide(font->m_Id->c_str()));
    if (!m_Fonts.empty())
        fonts->SelectLine(0, true);
}

const core::FontDeclaration* CFontViewerWindow::SelectedFont() const
{
    const auto* fonts = dynamic_cast<const gui::CComboBoxWidget*>(GetWidget("combobox_fonts", true));
    const int line = fonts ? fonts->GetSelectedLine() : -1;
    return line >= 0 && static_cast<size_t>(line) < m_Fonts.size() ? m_Fonts[static_cast<size_t>(line)] : nullptr;
}

void CFontViewerWindow::RebuildLabel()
{
    auto* edit = dynamic_cast<gui::CEditWidget*>(GetWidget("edit_text", true));
    const core::FontDeclaration* font = SelectedFont();
    OX_CHECK_DATA(edit != nullptr && font != nullptr);
    if (gui::CWidget* old = GetWidget("label_text", true))
        old->AddFlags(gui::FlagDead);
    auto* label = new gui::CLabelWidget();
    gui::WidgetPtrT held(label);
    label->SetId("label_text");
    label->SetFont(core::CFontManager::Instance().GetItem(font->m_Id->c_str()));
    label->SetText(edit->GetText());
    label->ResizeToFitText(true);
    const misc::FloatVector place = edit->GetAbsPos(false) - GetAbsPos(false);
    label->SetOffset(place.X, place.Y + edit->GetSize().Y + kLabelGap);
    AddWidget(held);
}

void CFontViewerWindow::OnChildAction(const std::string& action, gui::CWidget* sender)
{
    CWindow::OnChildAction(action, sender);
    const std::string& id = sender ? sender->GetId() : std::string();
    if (action == "line_selected" && id == "combobox_fonts") {
        RebuildLabel();
    } else if (action == "text_changed" && id == "edit_text") {
        auto* label = dynamic_cast<gui::CLabelWidget*>(GetWidget("label_text", true));
        if (label && !(label->GetFlags() & gui::FlagDead)) {
            label->SetText(static_cast<gui::CEditWidget*>(sender)->GetText());
            label->ResizeToFitText(true);
        }
    }
}

void CFontViewerWindow::DoUpdate()
{
    CWindow::DoUpdate();
    if (!m_Watcher.IsFilesChanged())
        return;
    const core::FontDeclaration* selected = SelectedFont();
    bool rebuild = false;
    for (const wstring& file : m_Watcher.GetChangedFiles()) {
        const std::string name = misc::WideToUtf8(file);
        for (const core::FontDeclaration* font : m_Fonts) {
            graphics::CFont* item = core::CFontManager::Instance().GetItem(font->m_Id->c_str());
            if (font->file != name || !item)
                continue;
            core::CFontManager::Instance().Reload(*font, *item, true);
            rebuild = rebuild || font == selected;
        }
    }
    m_Watcher.ResetChanges();
    if (rebuild)
        RebuildLabel();
}

bool CFontViewerWindow::OnKeyDown(int key, int keys, int rawKeyData, bool broadcast)
{
    if (key == 27 || key == gui::OX_ESC) {
        Close();
        return true;
    }
    return CWindow::OnKeyDown(key, keys, rawKeyData, broadcast);
}

void CFontViewerWindow::Close()
{
    gui::WindowPtrT self(this);
    if (gui::CBaseWindow* parent = GetParentWindow())
        parent->RemoveChildWindow();
    else
        AddFlags(gui::FlagDead);
}

void BindFontViewer(mluabind::Namespace& ns)
{
    ns.AddClass(mluabind::Class<CFontViewerWindow>("CFontViewerWindow").BaseClass<gui::CWindow>().Constructor<>());
    ns.AddClass(mluabind::IntrusivePtrClass<CFontViewerWindow>("CFontViewerWindowPtrT"));
}

} // namespace k17
