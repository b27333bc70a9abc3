#include "gui/WidgetFactory.h"

#include "gui/LuaWidget.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/CheckboxWidget.h"
#include "gui/controls/ClipWidget.h"
#include "gui/controls/EditWidget.h"
#include "gui/controls/ImageBoxWidget.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/LabelWidget.h"
#include "gui/controls/ProgressBarWidget.h"
#include "gui/controls/RadioButtonGroupWidget.h"
#include "gui/controls/ComboBoxWidget.h"
#include "gui/controls/ListWidget.h"
#include "gui/controls/ScrollWidget.h"
#include "gui/controls/SliderWidget.h"
#include "gui/controls/ToolbarWidget.h"
#include "gui/controls/TabWidget.h"

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
    // In the framework's order. The scroll, list, combo box, edit, slider, tab, table and
    // tree widgets join at their places when their classes exist.
    factory.RegisterWidget<CLabelWidget>("label_widget");
    factory.RegisterWidget<CImageWidget>("image_widget");
    factory.RegisterWidget<CButtonWidget>("button_widget");
    factory.RegisterWidget<CCheckboxWidget>("checkbox_widget");
    factory.RegisterWidget<CImageBoxWidget>("image_box_widget");
    factory.RegisterWidget<CRadioButtonGroupWidget>("radio_group_widget");
    factory.RegisterWidget<CProgressBarWidget>("progress_bar_widget");
    factory.RegisterWidget<CLuaWidget>("lua_widget");
    factory.RegisterWidget<CClipWidget>("clip_widget");
    factory.RegisterWidget<CToolbarWidget>("toolbar_widget");
    factory.RegisterWidget<CScrollWidget>("scroll_widget");
    factory.RegisterWidget<CListWidget>("list_widget");
    factory.RegisterWidget<CComboBoxWidget>("combobox_widget");
    factory.RegisterWidget<CSliderWidget>("slider_widget");
    factory.RegisterWidget<CEditWidget>("edit_widget");
    factory.RegisterWidget<CTabWidget>("tab_widget");
}

} // namespace ox::gui
