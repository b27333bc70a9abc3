-- Lantern Demo: the scheduler of script threads. Every object script runs as a coroutine;
-- the engine starts one through CreateScript and calls ManageThreads once per frame, which
-- resumes every thread whose wait is over. Time is the clock the thread manager was given
-- (qe.g_LuaThreadManager.Instance().SetTimer), so pausing that group pauses every wait.
-- qe.StartLevel loads it into the level's host (qe_level) and calls quest.StartLevel, which
-- hands that host and the level clock to the manager.

quest = quest or {}
-- Kept across reloads of the file: the threads already running go on.
threads = threads or { list = {}, script_object = nil }

local function manager()
    return qe.g_LuaThreadManager.Instance()
end

local resume, status = coroutine.resume, coroutine.status

-- The clock; during a scheduler pass, the time the pass started (one call into the engine
-- a frame rather than one a thread).
local function now()
    return threads.pass_time or manager().GetElapsedTime()
end

local function text(value)
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

-- Inside a thread: wait `ms` milliseconds of the threads' clock (0: until the next frame).
function wait(ms)
    coroutine.yield(now() + (ms or 0))
end

-- Resumes a thread once; a thread that raised is reported, naming its script, and dropped.
local function step(thread, ...)
    local ok, wake = resume(thread.co, ...)
    if not ok then
        thread.dead = true
        manager().Error("script thread " .. thread.name .. ": " .. tostring(wake))
    elseif status(thread.co) == "dead" then
        thread.dead = true
    else
        thread.wake = tonumber(wake) or now()
    end
end

-- The object the next script belongs to: that script is a click thread.
function quest.SetScriptObject(object)
    threads.script_object = object
end

-- A coroutine of the global function `name`, started at once with `object` as self.
function CreateScript(name, object)
    name = text(name)
    local fn = _G[name]
    local click = threads.script_object ~= nil
    threads.script_object = nil
    if type(fn) ~= "function" then
        manager().Error("CreateScript: no script function " .. name)
        return
    end
    local thread = { co = coroutine.create(fn), name = name, click = click, wake = 0 }
    table.insert(threads.list, thread)
    step(thread, object)
end

-- A thread started by a click is still alive.
function IsClikThread()
    for _, thread in ipairs(threads.list) do
        if thread.click and not thread.dead then
            return true
        end
    end
    return false
end

-- One pass: every thread whose wake time has come is resumed once; threads started during
-- the pass wait for the next one; finished threads are dropped.
function ManageThreads()
    local time = manager().GetElapsedTime()
    local list = threads.list
    threads.pass_time = time
    for i = 1, #list do
        local thread = list[i]
        if not thread.dead and thread.wake <= time then
            step(thread)
        end
    end
    threads.pass_time = nil
    -- Dropped in place, keeping the order.
    local kept = 0
    for i = 1, #list do
        local thread = list[i]
        list[i] = nil
        if not thread.dead then
            kept = kept + 1
            list[kept] = thread
        end
    end
end

-- The number of live threads.
function quest.ThreadCount()
    return #threads.list
end

-- What generated click scripts call around their body, and a click that changed nothing.
function pre_click_event() end
function post_click_event() end
function wrone_item_click() end
function empty_script_function(self) end

-- The start of a level, called by qe.StartLevel in the level's host: the threads run here on
-- the clock of the group "level" under "main"; then the init script given to qe.StartLevel
-- and the level's start script run. `id` is the level's id; the demo has no use for the
-- window, settings, title, mode and restart flag. Answers 1: the level runs.
function quest.StartLevel(window, level, id, settings, title, mode, restart)
    quest.level = level
    threads.list = {}
    local main = ox.core.GetRootGroupTimer().GetChildGroupTimer("main")
    manager().SetLua(ox.lua.CLua.GetLua("qe_level"))
    manager().SetTimer(main.GetChildGroupTimer("level") or main.AttachGroupTimer("level"))
    ox.lua.CLua.GetLua("qe_level").LoadScript("scripts/game_engine/level.lua")
    level_rules.Reset(level)
    qe.g_Cursor.Instance().SetHintFont("small")
    __g_InitScript()
    print("Lantern Demo: level " .. text(id) .. " starts in host qe_level")
    level.RunStartLevelScript()
    return 1
end

-- Runs the click script of the running level's object `id`, as a click on it would.
function quest.Click(id)
    local object = quest.level and quest.level.FindObjectById(id, false, false)
    if not object then
        manager().Error("quest.Click: the level has no object " .. id)
        return
    end
    qe.RunObjectScript(qe.CBaseSceneObject.ScriptMouseClick, object, true, true)
end
