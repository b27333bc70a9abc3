-- The game's script vocabulary as data, for the walk of tests/lua/vocabulary.lua.
--
-- `main` must stand whole in the main state, `level` in a level's state once __QEBindGame ran
-- for it, and `achievements` (this game's own store, which the level's rules use) in both.

local V = {}

local profile = {
    "GetName", "SetName", "GetGUID", "GetGameGUID", "SetGameGUID", "GetStep", "SetStep", "GetStepType",
    "SetStepType", "GetPointsCount", "SetPointsCount", "GetHintsCount", "SetHintsCount", "GetThermometerPoints",
    "SetThermometerPoints", "GetAlphaThermometerPoints", "SetAlphaThermometerPoints", "GetLevelState",
    "SetLevelState", "GetHintsUseCount", "SetHintsUseCount", "GetHintsUseFlag", "SetHintsUseFlag", "GetSaveFileName",
    constants = { GameStepTypeLevel = 0, GameStepTypeComics = 1, LevelStateTypeNew = 0, LevelStateTypeInGame = 1,
                  LevelStateTypeFinished = 2 },
}

local profileManager = {
    "GetSavesFolder", "CreateProfile", "DeleteProfile", "Rename", "GetCurrentProfile", GetProfile = 2,
    "EnumProfiles", SetCurrentProfile = 2, "CompareWithoutCase", "Save",
}

local difficulty = { DificultyLevelNoirmal = 0, DificultyLevelHard = 1 }

local profileValues = {
    ["k17.GameStepTypeLevel"] = 0, ["k17.GameStepTypeComics"] = 1, ["k17.LevelStateTypeNew"] = 0,
    ["k17.LevelStateTypeInGame"] = 1, ["k17.LevelStateTypeFinished"] = 2,
}

V.main = {
    tables = { "k17", "k17.misc", "k17.g_ProfileManager", "k17.g_GameOptions", "k17.g_RecordTable" },
    values = profileValues,
    functions = {
        "__QEBindGame", "k17.g_ProfileManager.Instance", "k17.g_GameOptions.Instance", "k17.g_RecordTable.Instance",
        "k17.CharToInt", "k17.misc.ExecuteFile", "k17.misc.CreateGUIDString",
    },
    classes = {
        ["k17.CProfile"] = profile,
        ["k17.CProfileManager"] = profileManager,
        ["k17.CGameOptions"] = {
            "ApplyOptionsChanges", "ApplyMusicChanges", "RestoreOptions", "RestoreResolution", "UpdateLocalSettings",
            "Save", "GetFullScreenMode", "SetFullScreenMode", "GetScreenMode", "SetScreenMode", "GetBrightness",
            "SetBrightness", "GetSoundVolume", "SetSoundVolume", "GetMusicVolume", "SetMusicVolume", "GetVoiceVolume",
            "SetVoiceVolume", "GetDificultyLevel", "SetDificultyLevel",
            constants = difficulty,
        },
        ["k17.RecordInfo"] = { members = { "Name", "Score" } },
        ["k17.CRecordTable"] = { "AddRecord", "Clear", "GetLastRecordPos", "GetRecords", "Save" },
        ["k17.CRecordTable.RecordsIteratorT"] = { Get = 2, "Next", "IsEnd" },
        ["k17.CFontViewerWindow"] = {}, ["k17.CFontViewerWindowPtrT"] = {},
    },
}

V.level = {
    tables = { "k17", "k17.misc", "k17.g_ProfileManager" },
    values = profileValues,
    functions = {
        "k17.g_ProfileManager.Instance", "k17.GetDificultyLevel", "k17.SetDificultyLevel", "k17.GetSoundVolume",
        "k17.GetMusicVolume", "k17.misc.RenderBorderedClip", "k17.misc.GetString",
    },
    classes = {
        ["k17.CProfile"] = profile,
        ["k17.CProfileManager"] = profileManager,
        ["k17.CGameOptions"] = { constants = difficulty },
    },
}

V.achievements = {
    functions = { "k17.g_Achievements.Instance" },
    classes = {
        ["k17.CAchievements"] = { "AddProgress", "GetProgress", "GetCompletion", "GetScore", "GetCount", "GetId",
                                  "GetMaxProgress", "GetShowProgressStep", "GetTitle", "GetDescription", "GetImage", "Save" },
    },
}

V.window_effects = {
    functions = { "k17.AddEffectToWidget", "k17.AddRemoveEffectToWidget" },
}

V.minigames = {
    tables = { "kminigames" }, -- and kminigames.g_MainLua, the main host (checked by the test)
    classes = {
        ["kminigames.CMiniGameWidget"] = {
            "SetOnCharScriptName", "GetOnCharScriptName", "SetOnKeyDownScriptName", "GetOnKeyDownScriptName",
            "SetOnKeyUpScriptName", "GetOnKeyUpScriptName", "SetOnMouseMoveScriptName", "GetOnMouseMoveScriptName",
            "SetOnMouseDownScriptName", "GetOnMouseDownScriptName", "SetOnMouseUpScriptName",
            "GetOnMouseUpScriptName", "SetOnDoubleClickScriptName", "GetOnDoubleClickScriptName",
            "SetOnMouseWheelScriptName", "GetOnMouseWheelScriptName", "SetOnUpdateScriptName",
            "GetOnUpdateScriptName", "SetGroupScriptName", "GetGroupScriptName", "SetOnPreferredSizeScriptName",
            "GetOnPreferredSizeScriptName", "SetOnChildActionScriptName", "GetOnChildActionScriptName",
            "SetGameResult", "GetGameResult", "SetOnLoadScriptName", "GetOnLoadScriptName", "OnEndGame",
            "GetPreferredSize", "OnMouseMove",
        },
    },
}

return V
