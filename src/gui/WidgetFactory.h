#pragma once
// The widget kinds a description can name: element name to a creator of the class. The
// framework, the quest engine and the game register their kinds at start-up; the layout box
// loader creates, loads and adds what a description names.
#include "gui/Widget.h"

#include <functional>
#include <string>
#include <string_view>
#include <unordered_map>

namespace ox::gui {

class CWidgetFactory {
public:
    using CreatorT = std::function<WidgetPtrT()>;

    // A later registration of a name replaces the earlier one.
    void RegisterWidget(std::string_view name, CreatorT creator);
    bool IsRegistered(std::string_view name) const;
    // The creator of a kind, or an empty one.
    CreatorT GetCreator(std::string_view name) const;
    void UnregisterWidget(std::string_view name);
    // A new widget of the kind, or null for an unknown name.
    WidgetPtrT Create(std::string_view name) const;
    // The same, loaded from `node`.
    WidgetPtrT Create(std::string_view name, const core::CSettingsGroup& node,
                      const core::CSettingsGroup& templates) const;

    // Registers a class by its default constructor.
    template <class Widget>
    void RegisterWidget(std::string_view name)
    {
        RegisterWidget(name, [] { return WidgetPtrT(new Widget()); });
    }

private:
    struct Hash : std::hash<std::string_view> {
        using is_transparent = void;
    };
    std::unordered_map<std::string, CreatorT, Hash, std::equal_to<>> m_Creators;
};

// The factory the descriptions are built with, for the whole run.
CWidgetFactory& GetWidgetFactory();

// Registers the framework's widget kinds in their order. Kinds whose classes don't exist yet
// are not registered: a description naming one logs a line and skips it.
void RegisterFrameworkWidgets(CWidgetFactory& factory);

} // namespace ox::gui
