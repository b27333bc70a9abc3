#pragma once
// Shared pieces of the window and widget manager tests: a window that notes what reaches it,
// a tool tip label, and a widget kind registered for the length of a test.
#include "gui/ProbeWidget.h"
#include "gui/TextWidget.h"
#include "gui/Window.h"

namespace oxtest {

// Notes its opening and closing and, in the hit-test pass, the mouse and key events that
// reach it ("down 3,4 0", "up", "dbl", "wheel 2", "key 10010 2", "char 97"), then handles
// them as a window does.
struct NotingWindow : ox::gui::CWindow {
    using IntVector = ox::misc::IntVector;
    static void Note(const std::string& what) { ProbeWidget::Journal().push_back(what); }

    void OnOpen() override
    {
        Note("open " + GetId());
        CWindow::OnOpen();
    }
    bool OnClose() override
    {
        Note("close " + GetId());
        return CWindow::OnClose();
    }
    bool OnMouseDown(const IntVector& p, ox::gui::MouseButtons button, int keys, bool broadcast) override
    {
        if (!broadcast)
            Note("down " + std::to_string(p.X) + "," + std::to_string(p.Y) + " " + std::to_string(button));
        return CWindow::OnMouseDown(p, button, keys, broadcast);
    }
    bool OnMouseUp(const IntVector& p, ox::gui::MouseButtons button, int keys, bool broadcast) override
    {
        if (!broadcast)
            Note("up");
        return CWindow::OnMouseUp(p, button, keys, broadcast);
    }
    bool OnDoubleClick(const IntVector& p, int keys, bool broadcast) override
    {
        if (!broadcast)
            Note("dbl");
        return CWindow::OnDoubleClick(p, keys, broadcast);
    }
    bool OnMouseWheel(const IntVector& p, int delta, int keys, bool broadcast) override
    {
        if (!broadcast)
            Note("wheel " + std::to_string(delta));
        return CWindow::OnMouseWheel(p, delta, keys, broadcast);
    }
    bool OnKeyDown(int key, int keys, int raw, bool broadcast) override
    {
        Note("key " + std::to_string(key) + " " + std::to_string(keys));
        return CWindow::OnKeyDown(key, keys, raw, broadcast);
    }
    bool OnChar(ox::wchar c, int keys, int raw, bool broadcast) override
    {
        Note("char " + std::to_string(c));
        return CWindow::OnChar(c, keys, raw, broadcast);
    }
};

// A tool tip label: 8 pixels a character, 16 high.
struct TextProbe : ox::gui::CWidget, ox::gui::ITextWidget {
    ox::wstring text;
    void SetText(const ox::wstring& t) override { text = t; }
    void ResizeToFitText() override { SetSize(8.0f * static_cast<float>(text.size()), 16); }
};

// A widget kind for the length of a test (none with an empty creator); what was registered
// before comes back.
class ScopedKind {
public:
    ScopedKind(const char* name, ox::gui::CWidgetFactory::CreatorT creator)
        : m_Name(name), m_Previous(ox::gui::GetWidgetFactory().GetCreator(name))
    {
        if (creator)
            ox::gui::GetWidgetFactory().RegisterWidget(name, std::move(creator));
        else
            ox::gui::GetWidgetFactory().UnregisterWidget(name);
    }
    ~ScopedKind()
    {
        if (m_Previous)
            ox::gui::GetWidgetFactory().RegisterWidget(m_Name, m_Previous);
        else
            ox::gui::GetWidgetFactory().UnregisterWidget(m_Name);
    }
    ScopedKind(const ScopedKind&) = delete;
    ScopedKind& operator=(const ScopedKind&) = delete;

    template <class Widget>
    static ox::gui::CWidgetFactory::CreatorT Of()
    {
        return [] { return ox::gui::WidgetPtrT(new Widget()); };
    }

private:
    std::string m_Name;
    ox::gui::CWidgetFactory::CreatorT m_Previous;
};

// A window of class W loaded from a description (and its GUITemplates) and laid out.
template <class W = NotingWindow>
boost::intrusive_ptr<W> LoadWindow(const std::string& xml)
{
    XmlDescription description(xml);
    boost::intrusive_ptr<W> window(new W());
    window->Load(description.Root(), description.Templates());
    window->UpdateLayout();
    return window;
}

} // namespace oxtest
