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
end

function quest.OnClose()
    print("Lantern Demo quest.OnClose: the lantern goes out")
end
