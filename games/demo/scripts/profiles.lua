-- Lantern Demo: players, their options and the table of records. main.lua loads this file
-- last. At the start the player of the last session goes on where they left the level. In
-- the first window P opens the players' chooser (gui.xml,
-- window "profiles"), R the records and F ends the level now (a shortcut until the level
-- can be played to its end). The level's state goes into the player's save file when the game
-- closes, when another player takes over and when the level ends.

Profiles = Profiles or {}
ProfilesWnd = ProfilesWnd or {}
RecordsWnd = RecordsWnd or {}

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

function Profiles.NewPlayer()
    local n = manager().EnumProfiles() + 1
    while manager().GetProfile("Player " .. n) do
        n = n + 1
    end
    local name = "Player " .. n
    manager().CreateProfile(name, false)
    Profiles.Switch(name)
    return name
end

-- The level is over: the player's score enters the table, which opens.
function Profiles.LevelFinished()
    local player = Profiles.Current() or manager().GetProfile(Profiles.NewPlayer())
    local seconds = os.time() - (Profiles.started or os.time())
    local score = math.max(10, 1000 - seconds)
    player.SetLevelState(k17.LevelStateTypeFinished)
    player.SetPointsCount(score)
    local place = records().AddRecord(player, score)
    records().Save()
    Profiles.SaveLevel()
    print("Lantern Demo: " .. (lantern.level_id or "level1") .. " finished by " .. S(player.GetName()) .. " with " .. score .. " points, place " .. place)
    Profiles.OpenRecords()
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
    local wnd = demo.OpenWindow("profiles")
    if wnd then
        print("Lantern Demo: the players' chooser opens")
        Profiles.FillChooser(wnd)
    end
end

function Profiles.OpenRecords()
    local wnd = demo.OpenWindow("records")
    if wnd then
        print("Lantern Demo: the records open")
        Profiles.FillRecords(wnd)
    end
end

function Profiles.FillChooser(wnd)
    local current = Profiles.Current()
    set(wnd, "current", current and ("Playing: " .. S(current.GetName())) or "Nobody plays yet: add a new player")
    Profiles.slots = {}
    local count = manager().EnumProfiles()
    -- The four newest players.
    for slot = 1, 4 do
        local player = manager().GetProfile(math.max(count, 4) - 4 + slot - 1)
        local name = player and S(player.GetName()) or ""
        Profiles.slots[slot] = name
        set(wnd, "slot" .. slot .. "_name", name)
    end
end

function Profiles.FillRecords(wnd)
    local it, place = records().GetRecords(), 1
    local last = records().GetLastRecordPos()
    while not it.IsEnd() do
        local record = it.Get()
        set(wnd, "row" .. place, string.format("%s%2d.  %-24s %6d", place == last and ">" or " ", place, S(record.Name),
                                               record.Score))
        place = place + 1
        it.Next()
    end
end

function ProfilesWnd.OnChildAction(wnd, action, sender)
    local id = S(sender.GetId())
    local slot = tonumber(id:match("^slot(%d)$") or "")
    if slot and Profiles.slots and Profiles.slots[slot] ~= "" then
        Profiles.Switch(Profiles.slots[slot])
    elseif id == "new_profile" then
        Profiles.NewPlayer()
    elseif id == "show_records" then
        Profiles.OpenRecords()
        return true
    elseif id == "play" then
        if not Profiles.Current() then
            Profiles.NewPlayer()
        end
        close(wnd)
        return true
    end
    Profiles.FillChooser(wnd)
    return true
end

function RecordsWnd.OnChildAction(wnd, action, sender)
    if S(sender.GetId()) == "close_records" then
        close(wnd)
    end
    return true
end

-- Hooks into main.lua's functions, made again whenever main.lua runs again.
local keys = { [80] = Profiles.OpenChooser, [82] = Profiles.OpenRecords, [70] = Profiles.LevelFinished }

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
        if not broadcast and keys[key] then
            keys[key]()
            return true
        end
        return base_key(self, key, mods, raw, broadcast)
    end
    DemoWindow.OnKeyDown = Profiles.on_key
end
