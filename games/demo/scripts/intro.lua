-- Lantern Demo: the videos. The intro plays before the main menu (a click or Escape skips
-- it), and a lamp's glow, a translucent video with an alpha track, hangs in the level's
-- window. make-videos.sh makes the files; without them (as in the headless tests) the menu
-- comes at once and the window has no glow. The windows are described in properties/gui.xml.
-- scripts/main.lua loads this file.

Intro = Intro or {}

local function say(line)
    print("Intro: " .. line)
end

-- The file exists beside the game (the videos are loose files of the staged game folder).
local function present(path)
    return ox.misc.CheckExistPath(path)
end

-- Opens the intro window over `parent` and plays the video; `after` runs when it is over.
-- False when there is no intro to play.
function Intro.Play(parent, after)
    if not (parent and present("video/intro.ogv")) then
        return false
    end
    local window = Menu and Menu.Make("intro")
    if not window then
        return false
    end
    local video = ox.graphics.COpaqueVideo()
    if not video.LoadFromFile("video/intro.ogv") then
        say("video/intro.ogv does not play")
        return false
    end
    Intro.video, Intro.window, Intro.after = video, window, after
    parent.AddChildWindow(window)
    say(string.format("plays video/intro.ogv, %dx%d, %d ms", video.GetWidth(), video.GetHeight(), video.GetDuration()))
    return true
end

-- The end of the intro, played through or skipped: the window closes and the menu follows.
function Intro.Finish(how)
    if not Intro.video then
        return
    end
    say(how .. " at " .. Intro.video.GetTime() .. " ms")
    Intro.video.Release()
    Intro.video = nil
    Intro.window.AddFlags(ox.gui.CBaseWidget.FlagDead)
    Intro.window = nil
    if Intro.after then
        Intro.after()
    end
end

IntroWindow = IntroWindow or {}

function IntroWindow.DoUpdate(self)
    local video = Intro.video
    if video then
        video.Update()
        if video.GetTime() >= video.GetDuration() then
            Intro.Finish("ended")
        end
    end
    return false
end

-- The picture fills the canvas, its shape kept (the intro is made 4:3 like the canvas).
function IntroWindow.DoDraw(self, renderer)
    local video = Intro.video
    if video and video.GetWidth() > 0 then
        local scale = math.min(1024 / video.GetWidth(), 768 / video.GetHeight())
        local w, h = video.GetWidth() * scale, video.GetHeight() * scale
        video.Draw(renderer, (1024 - w) / 2, (768 - h) / 2, w, h)
    end
    return false
end

function IntroWindow.OnMouseDown(self, x, y, button, keys, broadcast)
    if not broadcast then
        Intro.Finish("skipped by a click")
    end
    return true
end

function IntroWindow.OnKeyDown(self, key, keys, raw, broadcast)
    if key == ox.gui.OX_ESC then
        Intro.Finish("skipped by Escape")
    end
    return true
end

-- The lamp's glow in the level's window: the video loops; the widget takes no clicks.
LampGlow = LampGlow or {}

function LampGlow.DoUpdate(self)
    if LampGlow.video == nil then
        LampGlow.video = false
        if present("video/lamp.ogv") and present("video/lamp_alpha.ogv") then
            local video = ox.graphics.CTranslucentVideo()
            if video.LoadFromFile("video/lamp.ogv", "video/lamp_alpha.ogv") then
                video.CycleAfterEnd(true)
                LampGlow.video = video
                print("Lamp glow: video/lamp.ogv plays with its alpha track, " .. video.GetDuration() .. " ms a pass")
            end
        end
    end
    if LampGlow.video then
        LampGlow.video.Update()
    end
    return false
end

function LampGlow.DoDraw(self, renderer)
    if LampGlow.video then
        LampGlow.video.Draw(renderer, 0, 0)
    end
    return true
end
