-- Lantern Demo: the menus. Once loading is over the bar in the first window fills while the
-- menus are made, then the main menu fades in over that window: Play, Options, Profiles,
-- Records and Quit, each with a tool tip. The windows are described in properties/gui.xml.
-- scripts/main.lua loads it after the players' script: Run starts the game under the menu, and Play
-- opens the level's window.

Menu = Menu or {}

local function text(value)
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

local function say(line)
    print("Menu: " .. line)
end

-- The game's own start: Run as main.lua gives it. This file takes Run over (again after a
-- reload of main.lua, which gives it anew).
if Run ~= Menu.Run then
    Menu.gameRun = Run
end

-- The description of the window `id`, and the templates, or nil when there is none.
function Menu.Describe(id)
    if not g_Application then
        return nil
    end
    local ok, node, templates = pcall(function()
        local settings = g_Application.GetSettings()
        return settings.GetChildByAttributeRef("window", "id", id, true), settings.GetChild("GUITemplates", false)
    end)
    if not ok then
        say("the GUI description cannot be read: " .. tostring(node))
        return nil
    end
    return node, templates
end

-- The window `id` made from its description, or nil when the description has none.
function Menu.Make(id)
    local node, templates = Menu.Describe(id)
    if not node then
        say("no window \"" .. id .. "\" to open")
        return nil
    end
    local window = ox.gui.CWindow()
    window.Load(node, templates)
    window.UpdateLayout()
    return window
end

-- Makes the window `id` and opens it over `parent`, fading in. False when the description
-- has no such window.
function Menu.Open(parent, id)
    local window = parent and Menu.Make(id)
    if not window then
        return false
    end
    if id == "options" then
        OptionsWindow.Show(window)
    elseif id == "achievements" and AchievementsWnd then
        AchievementsWnd.Show(window)
    elseif id == "main_menu" then
        -- The buttons of windows the game doesn't have are disabled.
        for _, other in ipairs({ "profiles", "records" }) do
            local button = ox.gui.CButtonWidget.Cast(window.GetWidget(other, true))
            if button and Menu.found and Menu.found[other] == false then
                button.DisableButton(true)
            end
        end
    end
    window.SetColor(0x00FFFFFF)
    parent.AddChildWindow(window)
    window.AddEffect(ox.gui.CColorChangeEffect(0xFFFFFFFF, 400, 0, "main"))
    say("\"" .. id .. "\" opens")
    return true
end

-- A window closes at the next update of the one under it.
local function close(window)
    window.AddFlags(ox.gui.CBaseWidget.FlagDead)
end

-- The steps the bar counts: each makes sure of one window the menus open.
Menu.steps = { "main_menu", "options", "profiles", "records" }

function Run()
    -- The game starts under the menu: the music, the player's level, ready for Play.
    if Menu.gameRun then
        Menu.gameRun()
    end
    if not (g_Application and g_Application.GetSettings) then
        say("the application is not reachable from scripts: the game starts without a menu")
        Menu.Play()
        return
    end
    Menu.done = 0
    Menu.found = {}
end
Menu.Run = Run

-- The bar in the first window: one step a frame, then the main menu.
LoadingProgress = LoadingProgress or {}

function LoadingProgress.DoUpdate(self)
    if Menu.playing then
        Menu.PlayLevel()
        return false
    end
    if not Menu.done or Menu.done > #Menu.steps then
        return false
    end
    if Menu.done == #Menu.steps then
        Menu.done = Menu.done + 1
        -- The intro video first when there is one (scripts/intro.lua); the menu follows it.
        if not (Intro and Intro.Play(g_Application.GetMainWindow(), Menu.OpenMainMenu)) then
            Menu.OpenMainMenu()
        end
        return false
    end
    Menu.done = Menu.done + 1
    local id = Menu.steps[Menu.done]
    Menu.found[id] = Menu.Describe(id) ~= nil
    local bar = ox.gui.CProgressBarWidget.Cast(self.GetWidget("progress"))
    if bar then
        bar.SetValue(Menu.done / #Menu.steps)
    end
    return false
end

-- The main menu over the first window; without a menu the game starts at once.
function Menu.OpenMainMenu()
    if not Menu.Open(g_Application.GetMainWindow(), "main_menu") then
        Menu.Play()
    end
end

-- Play: StartGame when the game defines one. Else the menu closes and, at the first window's
-- next update, the level's window opens over that window, modal until the level is over;
-- then the menu comes back.
function Menu.Play(menu)
    if StartGame then
        StartGame()
        return
    end
    if menu then
        close(menu)
    end
    Menu.playing = true
end

function Menu.PlayLevel()
    Menu.playing = false
    local main = g_Application.GetMainWindow()
    local window = Menu.Make("game")
    if not window then
        return
    end
    say("the level's window opens")
    local result = main.DoModal(window)
    say("the level's window closed with " .. result)
    -- Everything found: the next level waits for Play (scripts/levels.lua).
    if result == 1 and Levels then
        Levels.Finished()
    end
    Menu.Open(main, "main_menu")
end

MainMenu = MainMenu or {}

function MainMenu.OnChildAction(self, action, sender)
    if text(action) ~= "pressed" then
        return false
    end
    local id = text(sender.GetId())
    say("pressed " .. id)
    if id == "play" then
        Menu.Play(self)
    elseif id == "profiles" and Profiles then
        Profiles.OpenChooser()
    elseif id == "records" and Profiles then
        Records.Open()
    elseif id == "options" or id == "profiles" or id == "records" or id == "achievements" then
        Menu.Open(self, id)
    elseif id == "quit" then
        g_Application.Stop()
    end
    return true
end

-- The options: what the player's options hold when the window opens. The volumes change as
-- their sliders move, so that the player hears them; OK applies the screen mode and saves.
OptionsWindow = OptionsWindow or {}

local function options()
    if k17 and k17.g_GameOptions then
        return k17.g_GameOptions.Instance()
    end
    return nil
end

-- The sliders of the volumes, by id, and the option each one sets.
local volumes = {
    music = { get = "GetMusicVolume", set = "SetMusicVolume" },
    sound = { get = "GetSoundVolume", set = "SetSoundVolume" },
    voice = { get = "GetVoiceVolume", set = "SetVoiceVolume" },
}

local function controls(window)
    return ox.gui.CComboBoxWidget.Cast(window.GetWidget("screen_mode", true)),
           ox.gui.CRadioButtonGroupWidget.Cast(window.GetWidget("difficulty", true))
end

local function slider(window, id)
    return ox.gui.CSliderWidget.Cast(window.GetWidget(id, true))
end

-- A new options window shows the player's options: line 1 of the screen modes is the full
-- screen, a slider's 0 to 1 a volume's 0 to 100.
function OptionsWindow.Show(window)
    local game = options()
    local screen, difficulty = controls(window)
    if not (game and screen and difficulty) then
        return
    end
    screen.SelectLine(game.GetFullScreenMode() and 1 or 0, false)
    difficulty.Check(game.GetDificultyLevel())
    for id, volume in pairs(volumes) do
        local control = slider(window, id)
        if control then
            control.SetValue(game[volume.get]() / 100, false)
        end
    end
end

function OptionsWindow.OnChildAction(self, action, sender)
    local what = text(action)
    local id = text(sender.GetId())
    local game = options()
    if what == "value_changed" and volumes[id] then
        local control = slider(self, id)
        if game and control then
            game[volumes[id].set](control.GetValue() * 100)
            game.ApplyMusicChanges()
        end
        return true
    end
    if what == "check_changed" or what == "change_checked" or what == "line_selected" or what == "list_showed" then
        say(what .. " " .. id)
        return true
    end
    if what ~= "pressed" or id ~= "ok" then
        return false
    end
    local screen, difficulty = controls(self)
    if game and screen and difficulty then
        game.SetFullScreenMode(screen.GetSelectedLine() == 1)
        game.SetDificultyLevel(difficulty.GetChecked())
        game.ApplyOptionsChanges()
        game.ApplyMusicChanges()
        game.UpdateLocalSettings()
        game.Save()
        say("options applied")
    else
        say("no game options to apply")
    end
    close(self)
    return true
end
