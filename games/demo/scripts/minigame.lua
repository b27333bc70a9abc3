-- Lantern Demo: a small mini-game in a kminigames.CMiniGameWidget (gui.xml, window "minigame").
-- M in the first window opens it: three lamps in a row, a click turns a lamp and its
-- neighbours on or off, and when all three burn the game ends with the number of moves as
-- its result, which the window reads and prints before it closes.

Lamps = Lamps or {}
LampsWindow = LampsWindow or {}

local function text(value)
    if type(value) == "userdata" and value.c_str then
        return value.c_str()
    end
    return tostring(value)
end

local LIT, DARK = 0xFFFFFFFF, 0xFF404040

function Lamps.Show(game)
    for i = 1, 3 do
        local lamp = game.GetWidget("lamp" .. i, true)
        if lamp then
            lamp.SetColor(Lamps.state[i] and LIT or DARK)
        end
    end
end

-- The widget is configured: the game starts with the middle lamp burning.
function Lamps.OnLoad(game)
    game.SetOnChildActionScriptName("OnChildAction")
    Lamps.state = { false, true, false }
    Lamps.moves = 0
    Lamps.Show(game)
end

function Lamps.OnChildAction(game, action, child)
    local n = tonumber(string.match(text(child.GetId()), "^lamp(%d)$") or "")
    if text(action) ~= "pressed" or not n then
        return
    end
    for i = n - 1, n + 1 do
        if Lamps.state[i] ~= nil then
            Lamps.state[i] = not Lamps.state[i]
        end
    end
    Lamps.moves = Lamps.moves + 1
    Lamps.Show(game)
    if Lamps.state[1] and Lamps.state[2] and Lamps.state[3] then
        game.SetGameResult(Lamps.moves)
        game.OnEndGame()
    end
end

function LampsWindow.OnChildAction(self, action, sender)
    if text(action) == "end_game" then
        local game = kminigames.CMiniGameWidget.Cast(sender)
        print("Lantern Demo: the lamps burn after " .. (game and game.GetGameResult() or "?") .. " moves")
        self.AddFlags(ox.gui.CBaseWidget.FlagDead)
    end
    return true
end

-- M over the first window opens the game over it.
function Lamps.Open(parent)
    local settings = g_Application.GetSettings()
    local node = settings.GetChildByAttributeRef("window", "id", "minigame", true)
    if not node then
        print("Lantern Demo: no mini-game window")
        return
    end
    local window = ox.gui.CWindow()
    window.Load(node, settings.GetChild("GUITemplates", false))
    window.UpdateLayout()
    parent.AddChildWindow(window)
end

if DemoWindow.OnKeyDown ~= Lamps.on_key then
    local base_key = DemoWindow.OnKeyDown
    Lamps.on_key = function(self, key, mods, raw, broadcast)
        if not broadcast and key == 77 then
            Lamps.Open(self)
            return true
        end
        return base_key(self, key, mods, raw, broadcast)
    end
    DemoWindow.OnKeyDown = Lamps.on_key
end
