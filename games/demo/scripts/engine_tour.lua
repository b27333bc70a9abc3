-- Lantern Demo: a walk through what the engine offers scripts, once loading is complete. Each
-- answer comes from the engine's own service: the clock of the group "main", the settings
-- read from game.xml, the string table, the declared textures and fonts, the audio manager
-- and the log. main.lua loads this file last; it runs its walk after main.lua's Run.

engine_tour = engine_tour or {}

local function text(value)
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

function engine_tour.Walk()
    local app = g_Application
    if not app then
        return
    end
    local clock = app.GetTimeManager().GetTimer("main")
    local settings = app.GetSettings().GetChild("settings", false)
    local title = ox.misc._T("$1")
    local disc = app.GetTextureManager().GetItem("demo_disc")
    local font = app.GetFontManager().GetItem("small")
    local audio = app.GetAudioManager()
    local line = ox.misc.FormatString("%s: the disc is %d", text(title), disc and disc.GetWidth() or 0).c_str() ..
                 " px wide, 'Lantern' " .. (font and font.GetStringWidth(std.wstring("Lantern")) or 0) ..
                 " px in the font small, show_fps " .. text(settings.GetValue("show_fps")) ..
                 ", music at volume " .. audio.GetGroupVolume("music") ..
                 ", main clock " .. (clock and (clock.IsPaused() and "paused" or "running") or "missing")
    print("Lantern Demo tour: " .. line)
    ox.diag.LogA("demo", ox.diag.LogInfo, "tour: " .. line)
end

-- Runs after main.lua's Run, which this file finds already defined; loading the file again
-- (as the file watcher does) does not wrap it twice.
if Run ~= engine_tour.Run then
    engine_tour.MainRun = Run
end
function engine_tour.Run()
    engine_tour.MainRun()
    engine_tour.Walk()
end
Run = engine_tour.Run
