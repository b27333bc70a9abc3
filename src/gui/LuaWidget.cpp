#include "gui/LuaWidget.h"

#include "graphics/Renderer.h"
#include "gui/Description.h"

namespace ox::gui {

void CLuaWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    CWidget::Load(node, templates);
    m_Hooks.SetLuaById(node.GetValue("lua"), DescribeElement(node));
    SetOverloadTable(node.GetValue("lua_overload_table"));
    lua::CLua* lua = m_Hooks.GetLua();
    if (!lua || m_Hooks.GetTable().empty())
        return;
    const std::string load = m_Hooks.Name("Load");
    if (lua::HasLuaFunction(*lua, load.c_str()))
        lua::CallLuaFunction(*lua, load.c_str(), this, &node, &templates);
}

void CLuaWidget::SetOverloadTable(const std::string& name)
{
    m_Hooks.SetTable(name);
    lua::CLua* lua = m_Hooks.GetLua();
    if (!lua || name.empty())
        return;
    const std::string create = m_Hooks.Name("__CreateInstance");
    if (!lua::HasLuaFunction(*lua, create.c_str()))
        return;
    const std::string instance = lua::CallLuaFunction<std::string>(*lua, create.c_str(), this);
    if (!instance.empty())
        m_Hooks.SetTable(instance);
}

bool CLuaWidget::OnChar(wchar character, int keys, int rawKeyData, bool broadcast)
{
    return Hook(HookOnChar, character, keys, rawKeyData, broadcast) ||
           CWidget::OnChar(character, keys, rawKeyData, broadcast);
}

bool CLuaWidget::OnKeyDown(int key, int keys, int rawKeyData, bool broadcast)
{
    return Hook(HookOnKeyDown, key, keys, rawKeyData, broadcast) || CWidget::OnKeyDown(key, keys, rawKeyData, broadcast);
}

bool CLuaWidget::OnKeyUp(int key, int keys, int rawKeyData, bool broadcast)
{
    return Hook(HookOnKeyUp, key, keys, rawKeyData, broadcast) || CWidget::OnKeyUp(key, keys, rawKeyData, broadcast);
}

bool CLuaWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    return Hook(HookOnMouseMove, pos.X, pos.Y, keys, broadcast) || CWidget::OnMouseMove(pos, keys, broadcast);
}

bool CLuaWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    return Hook(HookOnMouseDown, pos.X, pos.Y, static_cast<int>(button), keys, broadcast) ||
           CWidget::OnMouseDown(pos, button, keys, broadcast);
}

bool CLuaWidget::OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    return Hook(HookOnMouseUp, pos.X, pos.Y, static_cast<int>(button), keys, broadcast) ||
           CWidget::OnMouseUp(pos, button, keys, broadcast);
}

bool CLuaWidget::OnDoubleClick(const IntVector& pos, int keys, bool broadcast)
{
    return Hook(HookOnDoubleClick, pos.X, pos.Y, keys, broadcast) || CWidget::OnDoubleClick(pos, keys, broadcast);
}

bool CLuaWidget::OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    return Hook(HookOnMouseWheel, pos.X, pos.Y, delta, keys, broadcast) ||
           CWidget::OnMouseWheel(pos, delta, keys, broadcast);
}

void CLuaWidget::OnChildAction(const std::string& action, CWidget* sender)
{
    if (!Hook(HookOnChildAction, action.c_str(), sender))
        CWidget::OnChildAction(action, sender);
}

void CLuaWidget::DoDraw(graphics::CRenderer& renderer)
{
    if (!Hook(HookDoDraw, &renderer))
        CWidget::DoDraw(renderer);
}

void CLuaWidget::DoUpdate()
{
    if (!Hook(HookDoUpdate))
        CWidget::DoUpdate();
}

} // namespace ox::gui
