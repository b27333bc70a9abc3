-- Lantern Demo: the developer window (gui.xml, window "devtools"): the running level's scenes
-- and their objects as a tree. F12 in the first window opens it while the debug level of
-- game.xml allows it (DebugLight or more); F11 opens the font viewer (gui.xml, window
-- "font_viewer") at the same level. main.lua loads this file.

DevTools = DevTools or {}
DevToolsWnd = DevToolsWnd or {}

local function S(value)
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

function DevTools.Allowed()
    return g_Application.GetDebugLevel() >= ox.core.CApplication.DebugLight
end

function DevTools.Open()
    if not DevTools.Allowed() then
        print("Lantern Demo: the developer window needs debug level 2")
        return
    end
    local wnd = demo.OpenWindow("devtools")
    if wnd then
        print("Lantern Demo: the developer window opens")
        DevTools.Fill(ox.gui.CTreeWidget.Cast(wnd.GetWidget("devtools_tree", true)))
    end
end

-- The font viewer of game makers over the first window: the declared fonts, a text typed
-- in them, rebuilt when a font's file is saved again.
function DevTools.OpenFontViewer()
    if not DevTools.Allowed() then
        print("Lantern Demo: the font viewer needs debug level 2")
        return nil
    end
    local node, templates = Menu.Describe("font_viewer")
    if not node then
        return nil
    end
    local viewer = k17.CFontViewerWindow()
    viewer.Load(node, templates)
    viewer.UpdateLayout()
    demo.CentreWindow(viewer)
    g_Application.GetTopWindow().AddChildWindow(viewer)
    print("Lantern Demo: the font viewer opens")
    return viewer
end

-- One group for the level, one for each scene, one line for each object ("[group]" marks
-- the level's object groups). The tree shows the level; it doesn't edit it, so the handler
-- refuses every new parent.
function DevTools.Fill(tree)
    local N = ox.gui.CTreeWidget.CNode
    tree.Clear()
    tree.SetEventHandler(ox.lua.CLua.GetLua("main"), "DevTools.OnTreeEvent")
    local level = lantern and lantern.level
    if not level then
        tree.AddNode("no level runs", nil, 0)
        return 0
    end
    local top = tree.AddNode(S(level.GetId()), nil, N.FlagGroup + N.FlagExpanded)
    local objects, scenes = 0, level.GetScenes()
    while not scenes.IsEnd() do
        local scene = scenes.Get()
        local node = tree.AddNode(S(scene.GetId()), top, N.FlagGroup)
        local it = scene.GetObjects()
        while not it.IsEnd() do
            local object = it.Get()
            local group = object.GetType() == (qe.CBaseSceneObject.GroupType or 2)
            tree.AddNode(S(object.GetId()) .. (group and " [group]" or ""), node, 0)
            objects = objects + 1
            it.Next()
        end
        scenes.Next()
    end
    print("Lantern Demo: the developer window shows " .. level.EnumScenes() .. " scenes, " .. objects .. " objects")
    return objects
end

function DevTools.OnTreeEvent(tree, event, node, other)
    local T = ox.gui.CTreeWidget
    if event == T.EventCheckNodeParent then
        return false
    elseif event == T.EventTextDoubleClick then
        print("Lantern Demo: " .. S(node.GetText()))
    end
    return true
end

function DevToolsWnd.OnChildAction(wnd, action, sender)
    if S(sender.GetId()) == "close_devtools" then
        wnd.GetParentWindow().RemoveChildWindow()
    end
    return true
end

if DemoWindow.OnKeyDown ~= DevTools.on_key then
    local base_key = DemoWindow.OnKeyDown
    DevTools.on_key = function(self, key, mods, raw, broadcast)
        if not broadcast and key == ox.gui.OX_F12 then
            DevTools.Open()
            return true
        elseif not broadcast and key == ox.gui.OX_F11 then
            DevTools.OpenFontViewer()
            return true
        end
        return base_key(self, key, mods, raw, broadcast)
    end
    DemoWindow.OnKeyDown = DevTools.on_key
end
