-- Lantern Demo: the game's main script. The engine runs this file once its window is up
-- (and again whenever the file changes on disk), then calls Init; Run follows when loading
-- is complete.

-- Kept across reloads: running the file again must not lose what the game holds.
quest = quest or {}
lantern = lantern or { lit = 0 }

local function text(value)
    -- Engine strings reach scripts as std.string objects.
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

function Init()
    lantern.host = text(ox.lua.CLua.GetLua("main").GetId())
    print("Lantern Demo Init: " .. _VERSION .. " in host '" .. lantern.host .. "', lfs " ..
          (lfs and "present" or "missing"))
end

-- Once loading is over, the level (lantern.level_id, level1 at first) is built from the quest data and started in a Lua host of its
-- own, listed as qe_level. From there scripts/game_engine/quest.lua runs the level: its script
-- threads, on the clock of the group "level" under "main", and its objects' scripts.
function StartLevel()
    if lantern.level then
        return
    end
    local id = lantern.level_id or "level1"
    local level = qe.g_QuestData.Instance().CreateLevel(id)
    if not level then
        print("Lantern Demo: the quest data has no " .. id)
        return
    end
    lantern.level = qe.CLevelPtrT(level)
    local objects = 0
    local scenes = lantern.level.GetScenes()
    while not scenes.IsEnd() do
        objects = objects + scenes.Get().EnumObjects() + scenes.Get().EnumAreas()
        scenes.Next()
    end
    print("Lantern Demo: " .. id .. " built from the quest data: " .. lantern.level.EnumScenes() .. " scenes, " ..
          objects .. " objects")
    lantern.level_lua = lantern.level_lua or ox.lua.CLua("qe_level", true)
    local started = qe.StartLevel(lantern.level_lua, nil, level, id, nil,
                                  "print('Lantern Demo: the init script runs')", "The Lantern", "", false)
    print("Lantern Demo: qe.StartLevel gave " .. started)
end

-- Each kind of sound has a volume group of its own (properties/sounds.xml).
local volumes = { music = 60, clicks = 90, windows = 80, found = 100 }

function Run()
    lantern.lit = lantern.lit + 1
    print("Lantern Demo Run: the lantern is lit (" .. lantern.lit .. ")")
    local audio = ox.core.CAudioManager.Instance()
    for group, volume in pairs(volumes) do
        audio.SetGroupVolume(group, volume)
    end
    -- The music loops without end; it starts once, whatever runs this again.
    if not (lantern.music and audio.IsSound(lantern.music)) then
        lantern.music = audio.Play("music", -2, -2, -2, -2, -2)
    end
    print("Lantern Demo Run: music " .. (lantern.music ~= 0 and "plays" or "is silent") ..
          (audio.IsAudioAvailable() and "" or " (no audio output)"))
    StartLevel()
end

-- The first window's hooks (gui.xml, window "loading"). Each gets the window first. A
-- mouse or key hook takes the place of the window's own handling: SuperOn... runs that.
DemoWindow = DemoWindow or {}

function DemoWindow.OnChildAction(self, action, sender)
    print("DemoWindow: " .. text(action) .. " " .. text(sender.GetId()))
    return true
end

function DemoWindow.OnMouseDown(self, x, y, button, keys, broadcast)
    if not broadcast then
        print(string.format("DemoWindow: mouse down at %d,%d, button %d", x, y, button))
        ox.core.CAudioManager.Instance().Play("click", -2, -2, -2, -2, -2)
    end
    return self.SuperOnMouseDown(x, y, button, keys, broadcast)
end

function DemoWindow.OnKeyDown(self, key, keys, raw, broadcast)
    if key == ox.gui.OX_SPACE then
        lantern.lit = lantern.lit + 1
        print("DemoWindow: Space, the lantern is lit (" .. lantern.lit .. ")")
    elseif key ~= ox.gui.OX_NONE then
        print("DemoWindow: key " .. key)
    end
    return self.SuperOnKeyDown(key, keys, raw, broadcast)
end

-- The modal dialog's hooks (gui.xml, window "demo_dialog"): OK, Cancel and Escape end it.
DemoDialog = DemoDialog or {}

function DemoDialog.OnChildAction(self, action, sender)
    local id = text(sender.GetId())
    print("DemoDialog: " .. text(action) .. " " .. id)
    if id == "ok" then
        self.EndModal(1)
    elseif id == "cancel" then
        self.EndModal(0)
    end
    return true
end

function DemoDialog.OnKeyDown(self, key, keys, raw, broadcast)
    if key == ox.gui.OX_ESC then
        print("DemoDialog: Escape")
        self.EndModal(0)
        return true
    end
    return self.SuperOnKeyDown(key, keys, raw, broadcast)
end

function quest.OnClose()
    print("Lantern Demo quest.OnClose: the lantern goes out")
    -- The level ends: no more threads, and the script cache lets its objects go.
    qe.g_LuaThreadManager.Instance().Clear()
    qe.CSceneWidget.ClearScriptCache()
end

-- Players, options and records.
ox.lua.CLua.GetLua("main").LoadScript("scripts/profiles.lua")
-- The menus: the main menu, the options and the loading bar. They take Run over, after the
-- players' own, so Play starts the level with the player's progress.
ox.lua.CLua.GetLua("main").LoadScript("scripts/menu.lua")
-- What the engine offers scripts, walked once loading is complete (after Run).
ox.lua.CLua.GetLua("main").LoadScript("scripts/engine_tour.lua")
-- The lamps mini-game, M in the first window.
ox.lua.CLua.GetLua("main").LoadScript("scripts/minigame.lua")
-- Achievements: awarded in the level, shown from the main menu.
ox.lua.CLua.GetLua("main").LoadScript("scripts/achievements.lua")
-- The order of the levels: Play continues with the player's next level.
ox.lua.CLua.GetLua("main").LoadScript("scripts/levels.lua")
