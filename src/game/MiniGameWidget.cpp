#include "game/MiniGameWidget.h"

#include "gui/WidgetFactory.h"
#include "lua/Lua.h"
#include "lua/mluabind/StdBinding.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace kminigames {

using namespace ox;

void CMiniGameWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    CWidget::Load(node, templates);
    if (node.IsValue("script_name_group"))
        m_Names[ScriptGroup] = node.GetValue("script_name_group");
    SetOnLoadScriptName(node.GetValue("on_load_script"), node.GetValue("lua"));
}

void CMiniGameWidget::SetOnLoadScriptName(const std::string& name, const std::string& luaId)
{
    m_OnLoad = name;
    if (!m_Lua || m_Lua->GetId() != luaId)
        m_Lua = lua::CLua::GetLua(luaId);
    if (m_Lua && !name.empty())
        lua::CallLuaFunction(m_Lua, name.c_str(), this);
}

template <class... Args>
bool CMiniGameWidget::Forward(Slot slot, const Args&... args)
{
    if (!m_Lua || m_Names[slot].empty())
        return false;
    return lua::CallLuaFunction<bool>(m_Lua, (m_Names[ScriptGroup] + m_Names[slot]).c_str(), this, args...);
}

bool CMiniGameWidget::OnChar(wchar character, int keys, int rawKeyData, bool broadcast)
{
    return Forward(ScriptChar, static_cast<int>(character), keys, rawKeyData, broadcast) ||
           CWidget::OnChar(character, keys, rawKeyData, broadcast);
}

bool CMiniGameWidget::OnKeyDown(int key, int keys, int rawKeyData, bool broadcast)
{
    return Forward(ScriptKeyDown, key, keys, rawKeyData, broadcast) || CWidget::OnKeyDown(key, keys, rawKeyData, broadcast);
}

bool CMiniGameWidget::OnKeyUp(int key, int keys, int rawKeyData, bool broadcast)
{
    return Forward(ScriptKeyUp, key, keys, rawKeyData, broadcast) || CWidget::OnKeyUp(key, keys, rawKeyData, broadcast);
}

bool CMiniGameWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    return Forward(ScriptMouseMove, pos, keys, broadcast) || CWidget::OnMouseMove(pos, keys, broadcast);
}

bool CMiniGameWidget::OnMouseDown(const IntVector& pos, gui::MouseButtons button, int keys, bool broadcast)
{
    return Forward(ScriptMouseDown, pos, static_cast<int>(button), keys, broadcast) ||
           CWidget::OnMouseDown(pos, button, keys, broadcast);
}

bool CMiniGameWidget::OnMouseUp(const IntVector& pos, gui::MouseButtons button, int keys, bool broadcast)
{
    return Forward(ScriptMouseUp, pos, static_cast<int>(button), keys, broadcast) ||
           CWidget::OnMouseUp(pos, button, keys, broadcast);
}

bool CMiniGameWidget::OnDoubleClick(const IntVector& pos, int keys, bool broadcast)
{
    return Forward(ScriptDoubleClick, pos, keys, broadcast) || CWidget::OnDoubleClick(pos, keys, broadcast);
}

bool CMiniGameWidget::OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    return Forward(ScriptMouseWheel, pos, delta, keys, broadcast) || CWidget::OnMouseWheel(pos, delta, keys, broadcast);
}

void CMiniGameWidget::DoUpdate()
{
    if (m_Lua && !m_Names[ScriptUpdate].empty())
        lua::CallLuaFunction(m_Lua, (m_Names[ScriptGroup] + m_Names[ScriptUpdate]).c_str(), this);
}

misc::FloatVector CMiniGameWidget::GetPreferredSize() const
{
    FloatVector size = CWidget::GetPreferredSize();
    if (!m_Lua || m_Names[ScriptPreferredSize].empty())
        return size;
    const auto wanted = lua::CallLuaFunction<FloatVector>(m_Lua, (m_Names[ScriptGroup] + m_Names[ScriptPreferredSize]).c_str(),
                                                          const_cast<CMiniGameWidget*>(this));
    return {std::max(size.X, wanted.X), std::max(size.Y, wanted.Y)};
}

void CMiniGameWidget::OnChildAction(const std::string& action, gui::CWidget* child)
{
    if (m_Lua && !m_Names[ScriptChildAction].empty())
        lua::CallLuaFunction(m_Lua, (m_Names[ScriptGroup] + m_Names[ScriptChildAction]).c_str(), this, action, child);
    CWidget::OnChildAction(action, child);
}

void CMiniGameWidget::OnEndGame()
{
    if (gui::CBaseWidget* parent = GetParentWidget())
        parent->OnChildAction("end_game", this);
}

void RegisterMiniGameWidget(gui::CWidgetFactory& factory)
{
    factory.RegisterWidget<CMiniGameWidget>("minigame_widget");
}

namespace {

struct SlotName {
    const char* name;
    CMiniGameWidget::Slot slot;
};

constexpr SlotName kSlotNames[] = {
    {"OnChar", CMiniGameWidget::ScriptChar},           {"OnKeyDown", CMiniGameWidget::ScriptKeyDown},
    {"OnKeyUp", CMiniGameWidget::ScriptKeyUp},         {"OnMouseMove", CMiniGameWidget::ScriptMouseMove},
    {"OnMouseDown", CMiniGameWidget::ScriptMouseDown}, {"OnMouseUp", CMiniGameWidget::ScriptMouseUp},
    {"OnDoubleClick", CMiniGameWidget::ScriptDoubleClick}, {"OnMouseWheel", CMiniGameWidget::ScriptMouseWheel},
    {"OnUpdate", CMiniGameWidget::ScriptUpdate},       {"Group", CMiniGameWidget::ScriptGroup},
    {"OnPreferredSize", CMiniGameWidget::ScriptPreferredSize}, {"OnChildAction", CMiniGameWidget::ScriptChildAction},
};

// Set<Name>ScriptName and Get<Name>ScriptName for one slot.
template <CMiniGameWidget::Slot S>
void AddSlotAccessors(mluabind::i::CCl<CMiniGameWidget>& cls, const char* name)
{
    using W = CMiniGameWidget;
    const std::string base(name);
    cls.Method(("Set" + base + "ScriptName").c_str(), [](W& w, const std::string& n) { w.SetScriptName(S, n); });
    cls.Method(("Get" + base + "ScriptName").c_str(), [](const W& w) { return w.GetScriptName(S); });
}

template <size_t... I>
void AddAllSlotAccessors(mluabind::i::CCl<CMiniGameWidget>& cls, std::index_sequence<I...>)
{
    (AddSlotAccessors<kSlotNames[I].slot>(cls, kSlotNames[I].name), ...);
}

} // namespace

mluabind::Namespace BindMiniGames(ox::lua::CLua* mainLua)
{
    using W = CMiniGameWidget;
    auto& cls = mluabind::Class<W>("CMiniGameWidget")
                    .BaseClass<gui::CWidget>()
                    .Constructor<>()
                    .Method("SetOnLoadScriptName", &W::SetOnLoadScriptName)
                    .Method("GetOnLoadScriptName", &W::GetOnLoadScriptName)
                    .Method("SetGameResult", &W::SetGameResult)
                    .Method("GetGameResult", &W::GetGameResult)
                    .Method("OnEndGame", &W::OnEndGame)
                    .Method("GetPreferredSize", &W::GetPreferredSize)
                    .Method("OnMouseMove", &W::OnMouseMove);
    AddAllSlotAccessors(cls, std::make_index_sequence<std::size(kSlotNames)>());
    mluabind::Namespace ns("kminigames");
    ns.AddClass(cls);
    ns.AddConstant(mluabind::Constant("g_MainLua", mainLua));
    ns.AddClass(mluabind::IntrusivePtrClass<W>("CMiniGameWidgetPtrT"));
    // A sender or a found widget as the mini-game it is, or nil.
    ns.AddFunction(mluabind::Function("CMiniGameWidget.Cast",
                                      [](gui::CBaseWidget* widget) { return dynamic_cast<W*>(widget); }));
    return ns;
}

} // namespace kminigames
