#include "gui/WidgetFactory.h"

#include "gui/LuaWidget.h"

namespace ox::gui {

void CWidgetFactory::RegisterWidget(std::string_view name, CreatorT creator)
{
    m_Creators.insert_or_assign(std::string(name), std::move(creator));
}

bool CWidgetFactory::IsRegistered(std::string_view name) const { return m_Creators.find(name) != m_Creators.end(); }

CWidgetFactory::CreatorT CWidgetFactory::GetCreator(std::string_view name) const
{
    auto found = m_Creators.find(name);
    return found == m_Creators.end() ? CreatorT() : found->second;
}

void CWidgetFactory::UnregisterWidget(std::string_view name)
{
    if (auto found = m_Creators.find(name); found != m_Creators.end())
        m_Creators.erase(found);
}

WidgetPtrT CWidgetFactory::Create(std::string_view name) const
{
    auto found = m_Creators.find(name);
    return found == m_Creators.end() ? WidgetPtrT() : found->second();
}

WidgetPtrT CWidgetFactory::Create(std::string_view name, const core::CSettingsGroup& node,
                                  const core::CSettingsGroup& templates) const
{
    WidgetPtrT widget = Create(name);
    if (widget)
        widget->Load(node, templates);
    return widget;
}

CWidgetFactory& GetWidgetFactory()
{
    static auto* factory = new CWidgetFactory();
    return *factory;
}

void RegisterFrameworkWidgets(CWidgetFactory& factory)
{
    // In the framework's order: label, image, button, checkbox, scroll, list, combo box,
    // edit, slider, tab, table, image box, radio group and progress bar widgets come with the
    // controls; then the Lua widget; the clip, toolbar and tree widgets come with theirs.
    factory.RegisterWidget<CLuaWidget>("lua_widget");
}

} // namespace ox::gui
