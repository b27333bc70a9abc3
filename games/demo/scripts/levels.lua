-- Lantern Demo: the order of the levels. Play opens the level the player is at; when a level
-- is over (its window closes with 1), the player's step moves to the next one, which is built
-- at once, so that the next Play continues there. After the last level the quest starts over.
-- main.lua loads this file after the menus.

Levels = Levels or {}
Levels.order = { "level1", "level2" }

local function S(value)
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

-- The level after `id`, or nil after the last.
function Levels.Next(id)
    for i, level in ipairs(Levels.order) do
        if level == id then
            return Levels.order[i + 1]
        end
    end
    return nil
end

local function player()
    return k17 and k17.g_ProfileManager and k17.g_ProfileManager.Instance().GetCurrentProfile()
end

-- The level to build: the current player's step (the one after it once finished), else the
-- level the game is at.
function Levels.Current()
    local who = player()
    local step = who and S(who.GetStep()) or ""
    if step ~= "" and (Levels.Next(step) or step == Levels.order[#Levels.order]) then
        if who.GetLevelState() == k17.LevelStateTypeFinished then
            return Levels.Next(step) or Levels.order[1]
        end
        return step
    end
    return lantern.level_id or Levels.order[1]
end

-- StartLevel (main.lua) builds the level Levels.Current names.
if StartLevel ~= Levels.start then
    local base_start = StartLevel
    Levels.start = function()
        if not lantern.level then
            lantern.level_id = Levels.Current()
        end
        return base_start()
    end
    StartLevel = Levels.start
end

-- The level's window closed with everything found: the player goes on to the next level.
function Levels.Finished()
    local done = lantern.level_id or Levels.order[1]
    local next = Levels.Next(done)
    print("Lantern Demo: " .. done .. " is over; " .. (next and (next .. " comes next") or "the quest is complete"))
    local who = player()
    if who and Profiles and Profiles.EnterScore then
        Profiles.EnterScore(who)
    end
    if who then
        who.SetStep(next or Levels.order[1])
        who.SetStepType(k17.GameStepTypeLevel)
        who.SetLevelState(k17.LevelStateTypeNew)
        k17.g_ProfileManager.Instance().Save()
    end
    qe.g_LuaThreadManager.Instance().Clear()
    qe.CSceneWidget.ClearScriptCache()
    lantern.level = nil
    lantern.level_id = next or Levels.order[1]
    StartLevel()
end
