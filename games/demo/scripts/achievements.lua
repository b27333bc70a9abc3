-- Lantern Demo: achievements (properties/achievements.xml). The level's rules award them
-- (scripts/game_engine/level.lua) in the level's host, which gets the game's store through
-- __QEBindGame each time the level starts; the store keeps each player's progress in
-- <guid>.ach. The main menu's Achievements opens the window that shows them (properties/gui.xml,
-- window "achievements"). main.lua loads this file after the menus.

Achievements = Achievements or {}
AchievementsWnd = AchievementsWnd or {}

local function S(value)
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

-- The level's host gets the game's names whenever the level starts (again after a reload of
-- main.lua, which gives StartLevel anew).
if StartLevel ~= Achievements.StartLevel then
    Achievements.gameStartLevel = StartLevel
end

function StartLevel()
    if Achievements.gameStartLevel then
        Achievements.gameStartLevel()
    end
    if lantern and lantern.level_lua and __QEBindGame then
        __QEBindGame(lantern.level_lua)
    end
end
Achievements.StartLevel = StartLevel

-- One line of the window: the progress shown in the achievement's steps, or its place.
function Achievements.State(store, id)
    local place = store.GetCompletion(id)
    if place > 0 then
        return "Earned, number " .. place
    end
    local step = math.max(1, store.GetShowProgressStep(id))
    local shown = math.floor(store.GetProgress(id) / step) * step
    return shown .. " of " .. store.GetMaxProgress(id)
end

-- Fills a new window with the current player's achievements.
function AchievementsWnd.Show(window)
    local store = k17.g_Achievements.Instance()
    local function label(id)
        return ox.gui.CLabelWidget.Cast(window.GetWidget(id, true))
    end
    for row = 1, 3 do
        local title, state = label("ach" .. row .. "_title"), label("ach" .. row .. "_state")
        local id = row <= store.GetCount() and S(store.GetId(row - 1))
        if title and state then
            title.SetText(id and (S(store.GetTitle(id)) .. ": " .. S(store.GetDescription(id))) or "")
            state.SetText(id and Achievements.State(store, id) or "")
        end
    end
    local score = label("ach_score")
    if score then
        score.SetText("Score: " .. store.GetScore())
    end
end

function AchievementsWnd.OnChildAction(self, action, sender)
    if S(action) == "pressed" and S(sender.GetId()) == "close_achievements" then
        self.AddFlags(ox.gui.CBaseWidget.FlagDead)
        return true
    end
    return false
end
