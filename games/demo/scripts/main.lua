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

function Run()
    lantern.lit = lantern.lit + 1
    print("Lantern Demo Run: the lantern is lit (" .. lantern.lit .. ")")
end

function quest.OnClose()
    print("Lantern Demo quest.OnClose: the lantern goes out")
end
