-- The game's main script. The engine runs it once the window is up and calls Init; Run follows
-- when loading is complete. What print writes lands in k17_stdout.txt in the game folder.
quest = quest or {}

-- Engine strings reach scripts as std.string or std.wstring objects.
local function text(value)
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

function Init()
    print("Init: the game starts")
end

function Run()
    -- A text of properties/strings.xml, by its id.
    print(ox.misc.FormatString("Run: %s is loaded", text(ox.misc._T("$1"))).c_str())
end

-- Called when the game closes.
function quest.OnClose()
end
