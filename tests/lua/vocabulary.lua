-- The framework's script vocabulary as data, and the walk that checks it in a host.
--
-- A class entry lists its methods (a number gives the count of overloads, a bare name one),
-- `members` (data members and properties) and `constants` (name = value; true for any number).
-- `functions` lists free functions with their overload counts, `values` names and numbers
-- reachable from the globals, `tables` the namespaces.
--
-- `required` must stand whole after BindOX. `controls` are the basic controls and GUI effects,
-- and `pending` the names of later work, by topic: both are reported, present or not.
-- `not_built` belongs to the content editor and Flash, which this port leaves out: absent.

local V = {}

V.required = {
    tables = { "ox", "ox.core", "ox.graphics", "ox.gui", "ox.misc", "ox.misc.anim", "ox.lua", "ox.diag",
               "ox.diag.message", "ox.sound", "ox.replay", "std" },
    values = {
        g_OXPlatform = 1, ["ox.core.g_OXPlatform"] = 1,
        ["ox.core.OX_Unknown"] = 0, ["ox.core.OX_Windows"] = 1, ["ox.core.OX_MacOSX"] = 2, ["ox.core.OX_iPhone"] = 3,
        ["ox.graphics.BlendNormal"] = 2, ["ox.graphics.BlendAdditive"] = 3,
        ["ox.gui.JustifyLeft"] = -1, ["ox.gui.JustifyCenterH"] = 0, ["ox.gui.JustifyRight"] = 1,
        ["ox.gui.JustifyTop"] = -1, ["ox.gui.JustifyCenterV"] = 0, ["ox.gui.JustifyBottom"] = 1,
        ["ox.gui.OX_LEFT"] = 10000, ["ox.gui.OX_NONE"] = true, ["ox.gui.OX_ESC"] = true, ["ox.gui.OX_F1"] = true,
        ["ox.gui.OX_RETURN"] = true, ["ox.gui.OX_SPACE"] = true, ["ox.gui.OX_PGUP"] = true,
        ["ox.diag.LogTrace"] = 0, ["ox.diag.LogInfo"] = 1, ["ox.diag.LogWarning"] = 2, ["ox.diag.LogError"] = 3,
    },
    functions = {
        "ox.core.CAudioManager.Instance",
        "ox.misc.BitwiseOr", "ox.misc.BitwiseAnd", "ox.misc.BitwiseXor", "ox.misc.StringCompare",
        "ox.misc.WriteWindowsClipboardAsText", "ox.misc.ReadWindowsClipboardAsText", "ox.misc.AppendPath",
        "ox.misc.CheckExistPath", "ox.misc.CalcFileCRC", "ox.misc.SetNamedFullAccess", "ox.misc.Compress",
        "ox.misc.Uncompress", "ox.misc.SetCurrentDirectory", "ox.misc.GetCurrentDirectory",
        "ox.misc.Poly4ConvertToLocalPos", "ox.misc.Poly4ConvertToAbsPos", "ox.misc.CalculateFloatVectorModule",
        "ox.misc.Poly4FromRect", "ox.misc.Poly4FromPoints", "ox.misc.MatrixIdentity", ["ox.misc.MatrixRotation"] = 2,
        "ox.misc.MatrixTranslation", ["ox.misc.MatrixScale"] = 2, "ox.misc.MatrixInvert", "ox.misc.MessageBox",
        "ox.misc.MessageBoxW", "ox.misc.GetOrthogonalPos", "ox.misc.GetLinesIntersect", "ox.misc.GetBezierPos",
        "ox.misc.GetAngle", ["ox.misc.FormatString"] = 6, ["ox.misc._T"] = 3, ["ox.misc.T_"] = 2,
        "ox.misc.CStringTable.Instance", "ox.misc.g_StringTable.Instance",
        "ox.misc.anim.ReloadClips",
        "ox.gui.CCursor.Instance", "ox.gui.g_Cursor.Instance",
        "ox.lua.CLua.GetLua", "ox.lua.BindOX",
        "ox.replay.g_Record.Instance", "ox.replay.g_Playback.Instance",
        "ox.diag.LogW", "ox.diag.LogA", "ox.diag.message.Supress", ["ox.diag.message.ShowW"] = 2,
        ["ox.diag.message.ShowA"] = 2,
        "std.abs", "std.acos", "std.asin", "std.atan", "std.atan2", "std.atof", "std.ceil", "std.cos", "std.cosh",
        "std.exp", "std.floor", "std.log", "std.log10", "std.pow", "std.rand", "std.sin", "std.sinh", "std.sqrt",
        "std.srand", "std.tan", "std.tanh",
    },
    classes = {
        ["ox.core.CApplication"] = {
            "Load", "SetMainWindow", "GetMainWindow", "GetTopWindow", "ChangeScreenMode", "GetAppDataFolder",
            "Shutdown", "Stop", GetSettings = 2, GetResourceDeclarations = 2, "GetTimeManager", GetRenderer = 2,
            "GetTextureManager", "GetFontManager", "GetAudioManager", GetWidgetManager = 2, "GetDebugLevel",
            "SetDebugLevel", "LimitFPS",
            constants = { DebugNone = 0, DebugCheats = 1, DebugLight = 2, DebugHeavy = 3 },
        },
        ["ox.core.CTextureManager"] = { GetItem = 2, "GetItemId", "PreloadSurfacesByPrefix", "StopSurfacesPreloading",
                                        "UnloadAllOnDemandSurfaces" },
        ["ox.core.CFontManager"] = { GetItem = 2, GetItemId = 2 },
        ["ox.core.CAudioManager"] = {
            "IsAudioAvailable", "PauseAll", "GetGlobalVolume", "SetGlobalVolume", SetVolume = 2, GetVolume = 2,
            "GetMaxVolume", "GetPosition", "SetPosition", "GetPriority", "GetRepeatCount", "GetBalance", "GetSpeed",
            "GetLength", "Play", "StopAll", Stop = 2, IsSound = 2, "SetGroupVolume", "GetGroupVolume", "StopGroup",
            "UnloadAllOnDemandSounds",
        },
        ["ox.core.CSettingsGroup"] = {
            "GetId", "AddChild", "RemoveChild", "EnumChildren", "GetFirstChild", "GetFirstChildRef", "GetChild",
            "GetChildRef", "GetChildByAttribute", "GetChildByAttributeRef", "GetNamedChild", "GetNamedChildRef",
            "GetNextSibling", "GetNextSiblingRef", AddValue = 2, "IsValue", "GetValue", "EnumAttributes",
            "GetAttribute", "CopyTo",
        },
        ["ox.core.SettingsGroupPtrT"] = { "get" },
        ["ox.core.CSettings"] = { "LoadXml", "LoadXmlDirect" },
        ["ox.core.CTimer"] = { "GetK", "SetK", "GetTime", "SetTime", "GetFrameDelta", "Pause", "IsPaused", "Destroy" },
        ["ox.core.CGroupTimer"] = { "GetK", "SetK", "GetTime", "SetTime", "GetFrameDelta", "Pause", "IsPaused",
                                    "Destroy", "GetId", "AttachTimer", "AttachGroupTimer", "GetChildGroupTimer" },
        ["ox.core.CTimerWrapper"] = { Get = 2 },
        ["ox.core.CGroupTimerWrapper"] = { Get = 2 },
        ["ox.core.CTimeManager"] = { "Pause", "GetTime", "GetAppTime", "AttachTimer", "AttachGroupTimer", "GetTimer",
                                     "RemoveTimer", "RemoveGroupTimer" },

        ["ox.graphics.Color"] = { "Clamp", members = { "Red", "Green", "Blue", "Alpha" } },
        ["ox.graphics.CFont"] = { "GetStringWidth", members = { "PixHeight", "SpaceWidth", "LineSpacing", "Texture" } },
        ["ox.graphics.CRenderer"] = {
            "InitWindow", "UpdateWindowInfo", "SetSourceResolution", "GetSourceResolution", "RenderLine", "RenderRect",
            "RenderFilledPoly4", "RenderString", "RenderText", RenderTexture = 6, RenderTextureBox = 2, "BeginScene",
            "EndScene", "SetBlendMode", "SetColor", "GetColor", "ApplyMatrix", "GetMatrix", "SetClipPoly",
            "PushState", "PopState", "GetWidth", "GetHeight", "Is32BPP", "IsFullscreen", "GetActiveRect", "GetScale",
            "GetAvailableResolutions",
        },
        ["ox.graphics.Resolution"] = { members = { "Width", "Height", "Bpp32" } },
        ["ox.graphics.ResolutionsT"] = { "size", at = 2 },
        ["ox.graphics.CSurface"] = { "IsValid", "GetWidth", "GetHeight" },
        ["ox.graphics.UVRect"] = { members = { "u1", "v1", "u2", "v2" } },
        ["ox.graphics.CTexture"] = {
            GetSurface = 2, "GetSurfaceRect", "CreateBuffer", "LoadBuffer", "DropBuffer", "Pixel", "SurfaceIsBuffer",
            "CommitBits", "IsAnimated", "EnumFrames", "GetFrameSurfaceRect", "GetFrameByTime", "GetTimeByFrame",
            "GetWidth", "GetHeight", "GetAnimTime",
        },
        ["ox.graphics.CImage"] = {
            "Init", SetTexture = 2, "GetTexture", "GetTextureSize", Draw = 3, DrawTransformed = 2, "SetRect",
            "GetRect", "SetSourceRect", "GetSourceRect", "SetTransformationMatrix", "GetTransformationMatrix",
            "SetScale", "GetScale", "SetColor", "GetColor", "SetFlags", "GetFlags", "IsAnimated", "GetFrameCount",
            "PauseAnimation", "SetAnimationK", "GetAnimationK", "SetFrame", "SetTime", "GetTime",
            constants = { FlagBoxImage = 1, FlagIntDest = 2 },
        },

        ["ox.misc.FloatVector"] = { members = { "X", "Y" } },
        ["ox.misc.IntVector"] = { members = { "X", "Y" } },
        ["ox.misc.FloatRect"] = { members = { "X", "Y", "Width", "Height" } },
        ["ox.misc.IntRect"] = { members = { "X", "Y", "Width", "Height" } },
        ["ox.misc.ShortRect"] = { members = { "X", "Y", "Width", "Height" } },
        ["ox.misc.FloatMatrix"] = {},
        ["ox.misc.BoolFloatPair"] = {},
        ["ox.misc.Poly4"] = { "IsContains", Point = 2, "GetBoundingRect", "IsIntersects", "Scale" },
        ["ox.misc.Location"] = { "IsContains", "Scale", "GetPolyPos", "GetAbsPos", "GetPoly",
                                 members = { "Pos", "Contour", "Angle" } },
        ["ox.misc.StringA24"] = {}, ["ox.misc.StringA32"] = {}, ["ox.misc.StringA40"] = {},
        ["ox.misc.StringA56"] = {}, ["ox.misc.StringA88"] = {}, ["ox.misc.StringA120"] = {},
        ["ox.misc.StringW28"] = {}, ["ox.misc.StringW60"] = {}, ["ox.misc.StringW124"] = {},
        ["ox.misc.CFileWatcher"] = { "WatchFile", "ClearWatches", "IsFilesChanged", "GetChangedFiles", "ResetChanges" },
        ["ox.misc.CStringTable"] = { "GetString", FormatByStringsID = 3 },
        ["ox.misc.CLocalString"] = { "c_str" },
        ["ox.misc.CRefCountedObj"] = {},
        ["ox.misc.CXmlWriter"] = { "SaveToFile", Write = 2 },
        ["ox.misc.CXmlElement"] = { "Flush", "Attr" },

        ["ox.misc.anim.CClip"] = {
            Load = 2, "FindObject", "Update", "Draw", "Play", "Stop", "Pause", "Clear", "SetTime", "MoveTime",
            "GetViewSize", "SetPos", "GetPos", "SetSize", "GetSize", "SetAngle", "GetAngle", "SetColor", "GetColor",
            "DisableSounds", "FlipHorizontal", "FlipVertical",
        },
        ["ox.misc.anim.CClipObject"] = {
            "Play", "Pause", "Stop", "GetAnimationState", "SetAnimationType", "SetAnimationDirection",
            "GetAnimationDirection", "SetTime", "GetTime", "GetPeriodTime", "GetSound", "FlipHorizontal",
            "FlipVertical", "Reload", "Draw", "Update", "GetId", "SetPos", "GetPos", "GetPoly", "SetPoly",
            "ResetPoly", "SetAngle", "GetAngle", "SetColor", "GetColor", "SetAdditiveBlend", "IsAdditiveBlend",
            "GetFlipFlags", "AddFlipFlags", "RemFlipFlags", "SetFlipFlags", "GetCustomFlags", "AddCustomFlags",
            "RemCustomFlags", "SetCustomFlags", "GetLocation", "IsContains", "IsSnapToPath", "SetUserFlags",
            "GetUserFlags", "SetVisible", "IsVisible", "GetType", "GetState", "GetResourceId", "DisableSounds",
            "StopAllSounds", "SnapToPath", "SetPath", "GetPath", "Load", "LoadPathHelper",
            constants = { AnimationStatePlaying = 0, AnimationStatePaused = 1, AnimationStateStopped = 2,
                          AnimationTypeOnce = 0, AnimationTypeLoop = 1, AnimationTypePingPong = 2,
                          AnimationDirectionForward = 0, AnimationDirectionBackward = 1, FlipHorizontal = 1,
                          FlipVertical = 2 },
        },
        ["ox.misc.anim.CImageObject"] = { "SetImage", "GetImageId", "GetClassType" },
        ["ox.misc.anim.CClipViewObject"] = { "SetClip", "GetClipId", "GetClassType" },
        ["ox.misc.anim.CPathObject"] = { "IsClosed", "GetLength", "GetPosByCoef", "GetCoefByPos", "GetClassType" },

        ["ox.graphics.CParticleSystem"] = {
            "IsStopEmit", "IsContinuous", "LoadById", "Reset", "Update", "Render", "GetLifeParticlesCount",
            "DropOldPos", "IsDead", "GetFlags", "SetFlags", "GetEmission", "SetEmission", "GetEmiterSize",
            "SetTimer", "SetEmiterSize", "SetLocation",
            constants = { IsStopEmit = 32768, IsContinuous = 2048 },
        },

        ["ox.gui.IntInsets"] = {}, ["ox.gui.FloatInsets"] = {},
        ["ox.gui.CCursor"] = {}, ["ox.gui.CWidgetManager"] = { "GetKeyboardState" },
        ["ox.gui.CBaseWidget"] = {}, ["ox.gui.CWidget"] = {},
        ["ox.gui.CBaseWidget.WidgetIteratorT"] = {}, ["ox.gui.CBaseWidget.ConstWidgetIteratorT"] = {},
        ["ox.gui.CBaseWindow"] = {}, ["ox.gui.CWindow"] = {}, ["ox.gui.CLuaWidget"] = {},

        ["ox.replay.CRecord"] = { "Start", "IsRecording", "Stop", "SaveEvents" },
        ["ox.replay.CPlayback"] = { "Start", "IsPlaying", "Stop", "LoadEvents" },

        ["ox.lua.CLua"] = { "LoadScript", "LoadLuaScripts", Run = 2, "CheckFileChanges", "GetId" },

        ["std.string"] = { "c_str", "length", append = 5, constants = { npos = true } },
        ["std.wstring"] = { "c_str", "length", append = 5, constants = { npos = true } },
    },
}

-- Built right now beside this vocabulary: flipped into `required` when it is merged.
V.controls = {
    classes = {
        ["ox.gui.CEffect"] = { "InitWidget", "UpdateWidget", "IsDead", "SetDead" },
        ["ox.gui.CPositionChangeEffect"] = { "InitWidget", "UpdateWidget" },
        ["ox.gui.CColorChangeEffect"] = { "InitWidget", "UpdateWidget" },
        ["ox.gui.CImageWidget"] = { SetImage = 2, GetImage = 2, "SetStretchType", "GetStretchType",
                                    constants = { StretchMaximum = 0, StretchProportional = 1, StretchOnlyDecrease = 2,
                                                  StretchNo = 3 } },
        ["ox.gui.CLabelWidget"] = { "ResizeToFitText", "SetText", "GetText", "SetJustifications", "SetFontScale",
                                    "SetWordBreak" },
        ["ox.gui.CClipWidget"] = { "GetClip" },
        ["ox.gui.CButtonWidget"] = { "SetText", "GetText", "SetLabelColor", "GetButtonState", "GetButtonStateInt",
                                     "DisableButton", "OnButtonPressed", "OnMouseMove",
                                     constants = { StateNormal = 0, StateOver = 1, StatePressed = 2, StateDisabled = 3 } },
        ["ox.gui.CCheckboxWidget"] = { "Check", "IsChecked", "SetUnspecifiedState", "OnCheckChanged" },
        ["ox.gui.CRadioButtonGroupWidget"] = { "GetChecked", "Check", "OnChangeChecked" },
        ["ox.gui.CProgressBarWidget"] = { "SetImages", "SetValue" },
        ["ox.gui.CToolbarWidget"] = {},
        ["ox.gui.CToolTipHelperWidget"] = { "StopShowToolTip" },
        ["ox.gui.CScrollWidget"] = { "SetValue", "GetValue", "SetMaxValue", "GetMaxValue", "SetPageSize",
                                     "GetPageSize", "OnValueChanged", "SetButtonValue" },
        ["ox.gui.CComboBoxWidget"] = { "ClearLines", "EnumLines", "AddLine", "GetLine", "FindLine", "SetLine",
                                       "RemoveLine", "SelectLine", "GetSelectedLine", "ShowList" },
        ["ox.gui.CListWidget"] = {
            "CalcHeightToFitLines", "SetListHeight", "EnumLines", "ClearLines", "AddLine", "GetLine", "FindLine",
            "SetLine", "RemoveLine", "SelectLine", "GetSelectedLine", "GetScrollWidth", "SetLineJustifications",
            "SetListColors", "OnLineSelected",
            constants = { ListColorTextNormal = 0, ListColorTextSelected = 1, ListColorTextOver = 2,
                          ListColorSelection = 3 },
        },
        ["ox.gui.CSliderWidget"] = { "SetValue", "GetValue", "OnValueChanged" },
        ["ox.gui.CEditWidget"] = { "SetEditColors", "SelectText", "SetText", "GetText", "SetTextJustification",
                                   "SetMaxChars", "OnTextChanged" },
        ["ox.gui.CTabWidget"] = { "EnumPanels", "SelectPanel", "GetSelectedPanel", GetPanelContent = 2 },
    },
}

V.pending = {
    video = {
        classes = {
            ["ox.graphics.CVideoPlayer"] = { LoadFromFile = 2, "LoadFromFileAlpha", "IsTransparent", "GetWidth",
                                             "GetHeight", Draw = 2, "Update", "GetDuration", "GetTime" },
            ["ox.graphics.COpaqueVideo"] = { "Release", "LoadFromFile", "AttachSound", "GetTexture", "GetWidth",
                                             "GetHeight", Draw = 2, "Update", "GetDuration", "GetTime", "Pause",
                                             "Resume", "MoveToTime", "CycleAfterEnd" },
            ["ox.graphics.CTranslucentVideo"] = { "Release", "LoadFromFile", "AttachSound", "GetTexture", "GetWidth",
                                                  "GetHeight", Draw = 2, "Update", "GetDuration", "GetTime", "Pause",
                                                  "Resume", "MoveToTime", "CycleAfterEnd" },
        },
    },
    widgets = {
        classes = {
            ["ox.gui.CTableWidget"] = { "GetCell", "LoadRow", "FitCells", "GetCellsCount", "ClearTable", "SelectRow",
                                        "GetSelectedRow" },
            ["ox.gui.CTreeWidget"] = {},
        },
    },
}

V.not_built = {
    classes = {
        ["ox.graphics.CFlash"] = {}, ["ox.gui.CFlashWidget"] = {}, ["ox.gui.CTransformationWidget"] = {},
        ["ox.gui.CTimeLineWidget"] = {},
    },
}

-- The value at a dotted path from the globals, or nil.
local function lookup(path)
    local value = _G
    for part in string.gmatch(path, "[^.]+") do
        if type(value) ~= "table" then
            return nil
        end
        value = value[part]
    end
    return value
end

-- The entries of a name list: bare names count 1, keyed names their number.
local function counted(list)
    local entries = {}
    for key, value in pairs(list) do
        if type(key) == "number" then
            entries[#entries + 1] = { value, 1 }
        elseif type(value) == "number" then
            entries[#entries + 1] = { key, value }
        end
    end
    return entries
end

-- Walks a group with the host's probe; gives the names looked for, those found and the
-- problems (missing names and wrong overload counts), as text.
function V.walk(group, probe)
    local wanted, found, problems = 0, 0, {}
    local function expect(ok, text)
        wanted = wanted + 1
        if ok then
            found = found + 1
        else
            problems[#problems + 1] = text
        end
    end
    for _, name in ipairs(group.tables or {}) do
        expect(type(lookup(name)) == "table", "table " .. name)
    end
    for name, value in pairs(group.values or {}) do
        local actual = lookup(name)
        expect(type(actual) == "number" and (value == true or actual == value),
               "value " .. name .. " = " .. tostring(actual))
    end
    for _, entry in ipairs(counted(group.functions or {})) do
        local count = probe.functions(entry[1])
        expect(count == entry[2] and type(lookup(entry[1])) == "function",
               "function " .. entry[1] .. ": " .. count .. " of " .. entry[2] .. " overloads")
    end
    for class, names in pairs(group.classes or {}) do
        local present = probe.class(class) and type(lookup(class)) == "table"
        expect(present, "class " .. class)
        for _, entry in ipairs(counted(names)) do
            local count = present and probe.methods(class, entry[1]) or 0
            expect(count == entry[2], class .. "." .. entry[1] .. ": " .. count .. " of " .. entry[2] .. " overloads")
        end
        for _, member in ipairs(names.members or {}) do
            expect(present and probe.member(class, member), "member " .. class .. "." .. member)
        end
        for constant, value in pairs(names.constants or {}) do
            local actual = lookup(class .. "." .. constant)
            expect(actual == value or (value == true and type(actual) == "number"), "constant " .. class .. "." .. constant .. " = " .. tostring(actual))
        end
    end
    return wanted, found, table.concat(problems, "\n")
end

return V
