-- Lantern Demo: the rules of its levels, in the level's host (qe_level). quest.StartLevel loads
-- this file. The things to find are the objects whose click script calls find(); each scene
-- lists its own below the scene. A thing is taken into the box, picked from the box onto the
-- pointer and used on a group (use_item), which changes its state and then leads on. A hint,
-- once charged, makes the next thing of the scene sparkle and recharges on the level's clock.
-- The engine calls the functions of the click road (quest.SetModifyFlag, wrong_click,
-- clear_cursor, ...); the objects' click scripts in properties/quest.xml call the rules below.

quest = quest or {}
level_rules = level_rules or {}
local L = level_rules

-- Milliseconds a used hint takes to charge again, on the level's clock.
L.recharge_time = 15000
-- Places of the list of things to find below the scene (properties/gui.xml: find1...).
L.list_places = 6
-- Achievements earned by opening a group (properties/achievements.xml).
L.awards = { chest = "chest_opened" }

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

-- The widget `id` of the level window as the control `class` (ox.gui.CLabelWidget, ...), or nil.
local function control(class, id)
    local found = widget(id)
    return found and class.Cast(found)
end

local function is_find(object)
    local script = text(object.GetLuaScript(qe.CBaseSceneObject.ScriptMouseClick))
    return script:find("^%s*find%(") ~= nil
end

-- Each scene's things to find, in the order of the scene, and the scene of each.
local function list_things(level)
    L.lists, L.scene_of, L.to_find = {}, {}, {}
    local scenes = level.GetScenes()
    while not scenes.IsEnd() do
        local scene = scenes.Get()
        local id, list = text(scene.GetId()), {}
        local objects = scene.GetObjects()
        while not objects.IsEnd() do
            local object = objects.Get()
            if is_find(object) then
                local thing = text(object.GetId())
                list[#list + 1] = thing
                L.scene_of[thing] = id
                L.to_find[#L.to_find + 1] = thing
            end
            objects.Next()
        end
        L.lists[id] = list
        scenes.Next()
    end
end

-- A new level: nothing found, an empty box, no window yet, a hint ready.
function L.Reset(level)
    L.level = level
    -- Areas are places to click, not pictures.
    level.SetShowChildSceneAreas(false)
    list_things(level)
    L.found, L.count = {}, 0
    L.window, L.picked, L.modified = nil, false, false
    L.closeup, L.charge = nil, 1
    L.inventory_scene = nil
    box = qe.CObjectsBox()
    CreateScript("recharge_hints", nil)
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

-- A clip played over a scene at `pos` for `ms` milliseconds of the level's clock: it takes no
-- click, and goes when its time is over.
function sparkle(scene_id, pos, clip_id, ms)
    local scene = L.level.GetSceneById(scene_id)
    if not scene then
        return
    end
    local clip = qe.CClipObject()
    clip.SetClipId(clip_id)
    clip.SetPos(pos)
    clip.RaiseObjectFlag(qe.CBaseSceneObject.ObjectFlagDisable)
    local held = qe.CBaseSceneObjectPtrT(clip)
    scene.InsertObject(held, nil)
    scene.UpdateTotalChildList()
    CreateScript("remove_later", { scene = scene, object = held, ms = ms })
end

function remove_later(what)
    wait(what.ms)
    what.scene.RemoveObject(what.object.get())
    what.scene.UpdateTotalChildList()
end

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
    sparkle(L.scene_of[id], self.GetPos(), "found_sparkle", 900)
    sound("found")
    print(string.format("Lantern Demo: found %s (%d/%d), hint \"%s\"", id, L.count, #L.to_find, hint))
    L.ShowList()
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

-- A group that a thing from the box opens (the chest by the key): with the thing on the pointer
-- it takes the state `state` and the thing is used up; in that state a click leads to the
-- scene `next`, a close-up or a scene of its own.
function use_item(self, item, state, next)
    local group = __cast(self, "qe.CSceneGroup")
    local id = text(self.GetId())
    if group.IsCurrent(state) then
        quest.SetModifyFlag(true)
        local scene = L.level.GetSceneById(next)
        if scene and scene.GetFlags() % 4 >= 2 then
            open_closeup(next)
        else
            go(next)
        end
        return
    end
    local held = cursor().GetCursorObject()
    if held and text(held.GetId()) == item then
        quest.SetModifyFlag(true)
        group.SetCurrent(state, false, 0, nil)
        box.RemoveObject(item)
        local shown = L.inventory.IsContentObject(item)
        if shown then
            L.inventory.RemoveObject(shown)
            L.inventory.UpdateTotalChildList()
        end
        cursor().ClearCursor(false)
        sound("found")
        print("Lantern Demo: the " .. item .. " opens the " .. id)
        if L.awards[id] then
            award(L.awards[id])
        end
    else
        print("Lantern Demo: the " .. id .. " is locked")
    end
end

-- Another scene in the main scene widget.
function go(id)
    quest.SetModifyFlag(true)
    L.scene_widget.CloseChildScenes()
    local scene = L.level.GetSceneById(id)
    L.scene_widget.SetScene(scene)
    L.closeup = nil
    sound("door")
    scene.RunSceneScript()
    L.ShowList()
end

function show_scene(scene)
    print("Lantern Demo: the scene " .. text(scene.GetId()))
end

-- A close-up in a scene widget of its own, over the main one.
function open_closeup(id)
    local closeup = qe.CSceneWidget()
    closeup.SetScene(L.level.GetSceneById(id))
    L.scene_widget.AddWidget(closeup)
    L.closeup = id
    sound("window_open")
    print("Lantern Demo: the close-up " .. id .. " opens")
    L.ShowList()
end

-- A click that opens the close-up `id` (the crate's inside).
function look(id)
    quest.SetModifyFlag(true)
    open_closeup(id)
end

function close_closeup(id)
    quest.SetModifyFlag(true)
    L.scene_widget.CloseChildSceneById(id)
end

-- A closed scene widget goes away at the next update.
function quest.OnCloseScene(sceneWidget)
    local id = text(sceneWidget.GetSceneId())
    print("Lantern Demo: the close-up " .. id .. " closes")
    sceneWidget.AddFlags(ox.gui.CWidget.FlagDead)
    if L.closeup == id then
        L.closeup = nil
        L.ShowList()
    end
end

-- The scene the player looks at: the close-up when one is open.
local function shown_scene()
    if L.closeup then
        return L.closeup
    end
    local scene = L.scene_widget and L.scene_widget.GetScene()
    return scene and text(scene.GetId())
end

-- The things still to find in a scene.
local function left_in(scene_id)
    local left = {}
    for _, id in ipairs(L.lists[scene_id] or {}) do
        local object = L.level.FindObjectById(id, false, false)
        if not L.found[id] and object and not object.ReadObjectFlag(qe.CBaseSceneObject.ObjectFlagHidden) then
            left[#left + 1] = id
        end
    end
    return left
end

-- The list below the scene: the names of what is left to find in the scene shown.
function L.ShowList()
    local scene = shown_scene()
    if not (L.window and scene) then
        return
    end
    local left, names = left_in(scene), {}
    for place = 1, L.list_places do
        local label = control(ox.gui.CLabelWidget, "find" .. place)
        local id = left[place]
        local name = id and ox.misc._T(text(L.level.FindObjectById(id, false, false).GetHint())) or ""
        if label then
            label.SetText(name)
        end
        if id then
            names[#names + 1] = id
        end
    end
    print("Lantern Demo: to find in " .. scene .. ": " .. (#names > 0 and table.concat(names, ", ") or "nothing"))
end

-- Hints ----------------------------------------------------------------------------------------

-- The hint button and its bar show the charge; the button takes clicks only when charged.
local function show_charge()
    local bar = control(ox.gui.CProgressBarWidget, "hint_charge")
    if bar then
        bar.SetValue(L.charge)
    end
    local button = control(ox.gui.CButtonWidget, "hint")
    if button then
        button.DisableButton(L.charge < 1)
    end
end

-- A thread for the level's life: a used hint charges again over L.recharge_time.
function recharge_hints()
    local step = 250
    while true do
        if L.charge < 1 then
            L.charge = math.min(1, L.charge + step / L.recharge_time)
            if L.charge >= 1 then
                sound("hint_ready")
                print("Lantern Demo: the hint is charged again")
            end
        end
        show_charge()
        wait(step)
    end
end

-- The hint: the next thing to find in the scene shown sparkles for a while.
function use_hint()
    if L.charge < 1 then
        print(string.format("Lantern Demo: the hint is recharging (%d%%)", math.floor(L.charge * 100)))
        return
    end
    local scene = shown_scene()
    local id = scene and left_in(scene)[1]
    if not id then
        print("Lantern Demo: nothing left to find here")
        return
    end
    L.charge = 0
    show_charge()
    sparkle(scene, L.level.FindObjectById(id, false, false).GetPos(), "hint_glow", 2500)
    sound("hint")
    print("Lantern Demo: the hint shows the " .. id)
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
        sound("complete")
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
    -- The level's own music in place of the menu's.
    local audio = ox.core.CAudioManager.Instance()
    audio.StopGroup("music", 0)
    L.music = audio.Play(text(L.level.GetId()) .. "_music", -2, -2, -2, -2, -2)
    local first = L.level.GetScenes().Get()
    main.SetScene(first)
    L.closeup = nil
    first.RunSceneScript()
    L.ShowList()
    show_charge()
    return false
end

-- "complete" pressed: the level window closes.
function GameWindow.OnChildAction(self, action, sender)
    local id = text(sender.GetId())
    if text(action) ~= "pressed" then
        return true
    end
    if id == "complete" then
        print("Lantern Demo: the level window closes")
        local audio = ox.core.CAudioManager.Instance()
        audio.StopGroup("music", 0)
        audio.Play("music", -2, -2, -2, -2, -2)
        self.EndModal(1)
    elseif id == "hint" then
        use_hint()
    end
    return true
end
