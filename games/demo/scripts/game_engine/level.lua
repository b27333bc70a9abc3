-- Lantern Demo: the rules of level1, in the level's host (qe_level). quest.StartLevel loads this
-- file. Nine things are to be found in the garden, the shed and the chest; the key is taken
-- into the box, picked from the box onto the pointer and used on the chest, which then opens a
-- close-up. The engine calls the functions of the click road (quest.SetModifyFlag, wrong_click,
-- clear_cursor, ...); the objects' click scripts in properties/quest.xml call the rules below.

quest = quest or {}
level_rules = level_rules or {}
local L = level_rules

L.to_find = { "coin", "feather", "apple", "leaf", "bottle", "candle", "shell", "ring", "gem" }

local Removed = qe.CBaseSceneObject.ObjectFlagRemoved
-- A hidden widget still takes the mouse: what is put away is disabled too.
local Hidden = ox.gui.CWidget.FlagHidden + ox.gui.CWidget.FlagDisabled

local function text(value)
    if type(value) == "userdata" and value.c_str then
        return value.c_str()
    end
    return tostring(value)
end

local function cursor()
    return qe.g_Cursor.Instance()
end

local function sound(id)
    ox.core.CAudioManager.Instance().Play(id, -2, -2, -2, -2, -2)
end

local function widget(id)
    return L.window and L.window.GetWidget(id, true)
end

-- A new level: nothing found, an empty box, no window yet.
function L.Reset(level)
    L.level = level
    -- Areas are places to click, not pictures.
    level.SetShowChildSceneAreas(false)
    L.found, L.count = {}, 0
    L.window, L.picked, L.modified = nil, false, false
    box = qe.CObjectsBox()
end

-- The click road -----------------------------------------------------------------------------

function quest.SetModifyFlag(flag) L.modified = flag end
function quest.GetModifyFlag() return L.modified == true end
function quest.SetClickPos(pos) L.click = { pos.X, pos.Y } end

-- The end of every click: an object picked up during it stays on the pointer for the next.
function clear_cursor()
    if L.picked then
        L.picked = false
    else
        cursor().ClearCursor(false)
    end
end

function hide_message_later()
    wait(1000)
    local message = widget("message")
    if message then
        message.AddFlags(Hidden)
    end
end

-- A click that changed nothing: a sound and a line over the scene for a second.
function wrong_click(pos)
    print(string.format("Lantern Demo: nothing there at %d,%d", pos.X, pos.Y))
    sound("click")
    local message = widget("message")
    if message then
        message.RemFlags(Hidden)
        CreateScript("hide_message_later", nil)
    end
end

-- The pointer over an object shows a hand; its hint hangs beside it (drawn by the game cursor).
cursor_lua_widget = {
    SetGameCursor = function(id)
        L.hovered = text(id)
        ox.gui.CCursor.Instance().SetCursor(ox.gui.CCursor.CursorHand)
    end,
    DropGameCursor = function()
        L.hovered = nil
        ox.gui.CCursor.Instance().SetCursor(ox.gui.CCursor.CursorPointer)
    end,
}

-- The level's rules ----------------------------------------------------------------------------

-- A found thing fades out where it stood: hidden at once, so no click reaches it again, and
-- drawn while its fade runs.
local function fade_out(object)
    object.RaiseObjectFlag(qe.CBaseSceneObject.ObjectFlagHidden)
    local effect = qe.CAlphaEffect(qe.CBaseSceneObjectPtrT(object), false, false, 600, nil)
    qe.g_EffectsList.Instance().AddEffect(qe.CBaseEffectPtrT(effect))
end

-- One step towards an achievement of the current player, if there is one
-- (properties/achievements.xml); the game's store reaches this host through __QEBindGame
-- (scripts/achievements.lua).
local function award(id)
    if not (k17 and k17.g_Achievements and k17.g_ProfileManager.Instance().GetCurrentProfile()) then
        return
    end
    local store = k17.g_Achievements.Instance()
    local before = store.GetCompletion(id)
    local place = store.AddProgress(id, 1)
    if place > 0 and before == 0 then
        print("Lantern Demo: achievement " .. id .. " earned, number " .. place)
    end
end

-- One of the things to find: off the scene and off the list.
function find(self)
    local id = text(self.GetId())
    if L.found[id] then
        return
    end
    quest.SetModifyFlag(true)
    local hint = text(cursor().GetHintText())
    fade_out(self)
    -- Its hint goes with it.
    L.level.UpdateFocusedObject(nil)
    L.found[id] = true
    L.count = L.count + 1
    local entry = widget("find_" .. id)
    if entry then
        entry.AddFlags(Hidden)
    end
    sound("found")
    print(string.format("Lantern Demo: found %s (%d/%d), hint \"%s\"", id, L.count, #L.to_find, hint))
    award("first_find")
    award("sharp_eyes")
    L.level.RunLevelScript()
end

-- The key: into the box, and a picture of it into the box's scene, where a click picks it up.
function take(self)
    local id = text(self.GetId())
    if box.FindObjectInBox(id) then
        print("Lantern Demo: the " .. id .. " is in the box already")
        return
    end
    quest.SetModifyFlag(true)
    local shown = self.Clone().get()
    shown.SetPos(ox.misc.FloatVector(95, 75))
    shown.SetLuaScript("pick_up(self) do return end", qe.CBaseSceneObject.ScriptMouseClick)
    L.inventory.InsertObject(qe.CBaseSceneObjectPtrT(shown), nil)
    L.inventory.UpdateTotalChildList()
    self.RaiseObjectFlag(Removed)
    box.InsertObject(qe.CBaseSceneObjectPtrT(self), nil)
    sound("found")
    print("Lantern Demo: the " .. id .. " goes into the box (" .. box.EnumObjects() .. " in it)")
end

-- A click on the box's picture: the object itself goes on the pointer.
function pick_up(self)
    local id = text(self.GetId())
    local it = box.GetObjects()
    while not it.IsEnd() do
        local item = it.Get()
        if text(item.Item.GetId()) == id then
            quest.SetModifyFlag(true)
            cursor().SetCursorObject(item.Item.get())
            L.picked = true
            print("Lantern Demo: the " .. id .. " is on the pointer")
            return
        end
        it.Next()
    end
end

-- The chest: the key opens it; open, it shows what is inside.
function use_chest(self)
    local chest = __cast(self, "qe.CSceneGroup")
    if chest.IsCurrent("chest_open") then
        quest.SetModifyFlag(true)
        open_closeup("chest_inside")
        return
    end
    local held = cursor().GetCursorObject()
    if held and text(held.GetId()) == "key" then
        quest.SetModifyFlag(true)
        chest.SetCurrent("chest_open", false, 0, nil)
        box.RemoveObject("key")
        local shown = L.inventory.IsContentObject("key")
        if shown then
            L.inventory.RemoveObject(shown)
            L.inventory.UpdateTotalChildList()
        end
        cursor().ClearCursor(false)
        sound("found")
        print("Lantern Demo: the key opens the chest")
        award("chest_opened")
    else
        print("Lantern Demo: the chest is locked")
    end
end

-- Another scene in the main scene widget.
function go(id)
    quest.SetModifyFlag(true)
    L.scene_widget.CloseChildScenes()
    local scene = L.level.GetSceneById(id)
    L.scene_widget.SetScene(scene)
    scene.RunSceneScript()
end

function show_scene(scene)
    print("Lantern Demo: the scene " .. text(scene.GetId()))
end

-- A close-up in a scene widget of its own, over the main one.
function open_closeup(id)
    local closeup = qe.CSceneWidget()
    closeup.SetScene(L.level.GetSceneById(id))
    L.scene_widget.AddWidget(closeup)
    sound("window_open")
    print("Lantern Demo: the close-up " .. id .. " opens")
end

function close_closeup(id)
    quest.SetModifyFlag(true)
    L.scene_widget.CloseChildSceneById(id)
end

-- A closed scene widget goes away at the next update.
function quest.OnCloseScene(sceneWidget)
    print("Lantern Demo: the close-up " .. text(sceneWidget.GetSceneId()) .. " closes")
    sceneWidget.AddFlags(ox.gui.CWidget.FlagDead)
end

function quest.OnLevelChanged() end

-- The level script, run after each find.
function check_level()
    if L.count == #L.to_find then
        print("Lantern Demo: the level is complete")
        local complete = widget("complete")
        if complete then
            complete.RemFlags(Hidden)
        end
    end
end

-- The game window (properties/gui.xml, window "game") -------------------------------------------

GameWindow = GameWindow or {}

-- At its first update a new level window (its scene widget still empty) gets the level's
-- scenes. The window is held from here, so that threads still running when it closes find it.
function GameWindow.DoUpdate(self)
    local main = __cast(self.GetWidget("scene", true), "qe.CSceneWidget")
    if main.GetScene() then
        return false
    end
    L.window = self
    L.window_held = ox.gui.CBaseWidgetPtrT(self)
    L.scene_widget = main
    local shelf = __cast(self.GetWidget("inventory", true), "qe.CSceneWidget")
    L.inventory_scene = L.inventory_scene or qe.CScenePtrT(qe.CScene())
    L.inventory = L.inventory_scene.get()
    L.inventory.SetSize(ox.misc.FloatVector(190, 150))
    shelf.SetScene(L.inventory)
    widget("message").AddFlags(Hidden)
    widget("complete").AddFlags(Hidden)
    for id in pairs(L.found) do
        widget("find_" .. id).AddFlags(Hidden)
    end
    local first = L.level.GetSceneById("garden")
    main.SetScene(first)
    first.RunSceneScript()
    return false
end

-- "complete" pressed: the level window closes.
function GameWindow.OnChildAction(self, action, sender)
    if text(action) == "pressed" and text(sender.GetId()) == "complete" then
        print("Lantern Demo: the level window closes")
        self.EndModal(1)
    end
    return true
end
