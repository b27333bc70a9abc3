-- Lantern Demo: players and their options (the table of records is scripts/records.lua).
-- main.lua loads this file last. At the start the player of the last session goes on where
-- they left the level. In the first window P opens the players' chooser (gui.xml, window
-- "profiles", where a new player's name is typed), R the records and F ends the level now (a
-- shortcut until the level can be played to its end). The level's state goes into the player's
-- save file when the game closes, when another player takes over and when the level ends.

Profiles = Profiles or {}
ProfilesWnd = ProfilesWnd or {}

local function S(value)
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

local function manager() return k17.g_ProfileManager.Instance() end
local function options() return k17.g_GameOptions.Instance() end
local function records() return k17.g_RecordTable.Instance() end

-- The player's volumes to the demo's groups: it has no voices, and its sounds other than the
-- music have groups of their own, which follow the sound volume.
local sound_groups = { "clicks", "windows", "found" }

function Profiles.ApplyVolumes()
    local o = options()
    local audio = ox.core.CAudioManager.Instance()
    audio.SetGroupVolume("music", o.GetMusicVolume())
    for _, group in ipairs(sound_groups) do
        audio.SetGroupVolume(group, o.GetSoundVolume())
    end
end

function Profiles.Current()
    return manager().GetCurrentProfile()
end

-- The running level's state into the current player's save file, and the player's place.
function Profiles.SaveLevel()
    local player = Profiles.Current()
    if not (player and lantern and lantern.level) then
        return
    end
    local id = lantern.level_id or "level1"
    player.SetStep(id)
    player.SetStepType(k17.GameStepTypeLevel)
    if player.GetLevelState() == k17.LevelStateTypeNew then
        player.SetLevelState(k17.LevelStateTypeInGame)
    end
    if demo.SaveLevelState(lantern.level.get(), player.GetSaveFileName()) then
        print("Lantern Demo: " .. S(player.GetName()) .. "'s level saved")
    end
    manager().Save()
end

-- The current player's saved state onto the running level; a new player gets a play-through
-- of their own.
function Profiles.RestoreLevel()
    local player = Profiles.Current()
    if not (player and lantern and lantern.level) then
        return
    end
    if S(player.GetGameGUID()) == "" then
        player.SetGameGUID(k17.misc.CreateGUIDString())
    end
    Profiles.started = os.time()
    local id = lantern.level_id or "level1"
    if S(player.GetStep()) == id and player.GetLevelState() ~= k17.LevelStateTypeNew and
            demo.RestoreLevelState(lantern.level.get(), player.GetSaveFileName()) then
        print("Lantern Demo: " .. S(player.GetName()) .. " goes on where they left " .. id)
    else
        print("Lantern Demo: " .. S(player.GetName()) .. " starts " .. id)
    end
end

-- Another player takes over: the level is saved for the one who leaves and built fresh for
-- the one who comes, with their options.
function Profiles.Switch(name)
    local leaving = Profiles.Current()
    if leaving and S(leaving.GetName()) == name then
        return
    end
    Profiles.SaveLevel()
    manager().SetCurrentProfile(name)
    manager().Save()
    Profiles.ApplyVolumes()
    if lantern and lantern.level then
        qe.g_LuaThreadManager.Instance().Clear()
        qe.CSceneWidget.ClearScriptCache()
        lantern.level = nil
        StartLevel()
    end
    Profiles.RestoreLevel()
end

-- A new player by the name typed for them, or "Player <n>" without one. A name that is
-- taken makes that player current.
function Profiles.NewPlayer(typed)
    local name = typed or ""
    if name == "" then
        local n = manager().EnumProfiles() + 1
        while manager().GetProfile("Player " .. n) do
            n = n + 1
        end
        name = "Player " .. n
    end
    if not manager().GetProfile(name) then
        manager().CreateProfile(name, false)
        print("Lantern Demo: new player " .. name)
    end
    Profiles.Switch(name)
    return name
end

-- The level is over: `player`'s score enters the table; the place it took.
function Profiles.EnterScore(player)
    local seconds = os.time() - (Profiles.started or os.time())
    local score = math.max(10, 1000 - seconds)
    player.SetLevelState(k17.LevelStateTypeFinished)
    player.SetPointsCount(score)
    local place = records().AddRecord(player, score)
    records().Save()
    Profiles.SaveLevel()
    print("Lantern Demo: " .. (lantern.level_id or "level1") .. " finished by " .. S(player.GetName()) .. " with " .. score .. " points, place " .. place)
    return place
end

-- F: the level ends now; the score enters the table (a player is made when nobody plays
-- yet), which opens.
function Profiles.LevelFinished()
    Profiles.EnterScore(Profiles.Current() or manager().GetProfile(Profiles.NewPlayer()))
    Records.Open()
end

-- Windows. A window opens over the top one and closes through the window under it.
local function set(wnd, id, text)
    local widget = wnd.GetWidget(id, true)
    if widget then
        demo.SetText(widget, text)
    end
end

local function close(wnd)
    wnd.GetParentWindow().RemoveChildWindow()
end

function Profiles.OpenChooser()
    Profiles.typing = false
    local wnd = demo.OpenWindow("profiles")
    if wnd then
        print("Lantern Demo: the players' chooser opens")
        Profiles.FillChooser(wnd)
    end
end

-- The list of players in the chooser (a Lua stand-in passes as it is), or nil.
local function players_list(widget)
    if type(widget) == "userdata" then
        return ox.gui.CListWidget.Cast(widget)
    end
    return type(widget) == "table" and widget or nil
end

local function show_current(wnd)
    local current = Profiles.Current()
    set(wnd, "current", current and ("Playing: " .. S(current.GetName())) or "Nobody plays yet: add a new player")
    return current
end

function Profiles.FillChooser(wnd)
    local current = show_current(wnd)
    local list = players_list(wnd.GetWidget("players", true))
    if not list then
        return
    end
    list.ClearLines()
    local selected = -1
    for index = 0, manager().EnumProfiles() - 1 do
        local name = S(manager().GetProfile(index).GetName())
        list.AddLine(name)
        if current and name == S(current.GetName()) then
            selected = index
        end
    end
    list.SelectLine(selected, false)
end

-- The box a new player's name is typed in, or nil.
local function name_box(wnd)
    local widget = wnd.GetWidget("new_name", true)
    return type(widget) == "userdata" and ox.gui.CEditWidget.Cast(widget) or nil
end

function ProfilesWnd.OnChildAction(wnd, action, sender)
    local id = S(sender.GetId())
    if id == "new_name" then
        -- Typing changes nothing until "New player"; while the box has the focus the first
        -- window's letter keys are letters of a name.
        if action == "got_focus" or action == "lost_focus" then
            Profiles.typing = action == "got_focus"
        end
        return true
    elseif id == "players" then
        -- The list keeps its lines: it is in the middle of reporting one of them.
        local list = players_list(sender)
        local line = list and list.GetSelectedLine() or -1
        if line >= 0 then
            Profiles.Switch(S(list.GetLine(line)))
            show_current(wnd)
        end
        return true
    elseif id == "new_profile" then
        local box = name_box(wnd)
        Profiles.NewPlayer(box and S(box.GetText()))
        if box then
            box.SetText("")
        end
        Profiles.FillChooser(wnd)
    elseif id == "show_records" then
        Records.Open()
        return true
    elseif id == "play" then
        if not Profiles.Current() then
            Profiles.NewPlayer()
        end
        Profiles.typing = false
        close(wnd)
    end
    -- Anything else (the list's own scroll bar, say) leaves the chooser as it is.
    return true
end

-- Hooks into main.lua's functions, made again whenever main.lua runs again.
local keys = { [80] = Profiles.OpenChooser, [82] = function() Records.Open() end, [70] = Profiles.LevelFinished }

if Run ~= Profiles.run then
    local base_run = Run
    Profiles.run = function()
        base_run()
        Profiles.ApplyVolumes()
        if Profiles.Current() then
            Profiles.RestoreLevel()
        else
            print("Lantern Demo: nobody plays yet; P opens the players' chooser")
        end
    end
    Run = Profiles.run
end

if quest.OnClose ~= Profiles.on_close then
    local base_close = quest.OnClose
    Profiles.on_close = function()
        Profiles.SaveLevel()
        return base_close()
    end
    quest.OnClose = Profiles.on_close
end

if DemoWindow.OnKeyDown ~= Profiles.on_key then
    local base_key = DemoWindow.OnKeyDown
    Profiles.on_key = function(self, key, mods, raw, broadcast)
        if not broadcast and keys[key] and not Profiles.typing then
            keys[key]()
            return true
        end
        return base_key(self, key, mods, raw, broadcast)
    end
    DemoWindow.OnKeyDown = Profiles.on_key
end
