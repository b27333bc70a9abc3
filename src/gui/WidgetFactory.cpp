#include "gui/WidgetFactory.h"

namespace ox::gui {

void CWidgetFactory::RegisterWidget(std::string_view name, CreatorT creator)
{
    m_Creators.insert_or_assign(std::string(name), std::move(creator));
}

bool CWidgetFactory::IsRegistered(std::string_view name) const { return m_Creators.find(name) != m_Creators.end(); }

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

} // namespace ox::gui
