#include "game/App.h"

#include "core/FontManager.h"
#include "core/ParticlesLoader.h"
#include "core/ScriptVocabulary.h"
#include "core/SettingsReaders.h"
#include "core/TextureDeclarations.h"
#include "core/TextureManager.h"
#include "diag/Log.h"
#include "game/DemoShell.h"
#include "game/GameBinding.h"
#include "game/GameOptions.h"
#include "game/LevelState.h"
#include "game/LoadWindow.h"
#include "game/MiniGameWidget.h"
#include "game/Profile.h"
#include "game/RecordTable.h"
#include "game/WindowEffects.h"
#include "gui/Cursor.h"
#include "gui/GuiServices.h"
#include "gui/WidgetFactory.h"
#include "lua/LuaHeap.h"
#include "graphics/Font.h"
#include "graphics/ParticleSystem.h"
#include "misc/Unicode.h"
#include "misc/animation/Clip.h"
#include "misc/animation/ClipServices.h"
#include "misc/animation/ClipsLoader.h"
#include "misc/sys/Path.h"
#include "quest/AlphaImageWidget.h"
#include "quest/Effects.h"
#include "quest/LuaThreadManager.h"
#include "quest/QuestBinding.h"
#include "quest/QuestData.h"
#include "quest/SceneWidget.h"
#include "replay/Replay.h"
#include "sound/AudioManager.h"
#include "sound/SoundDeclarations.h"

#include <fcntl.h>
#include <unistd.h>

#include <cstdio>

namespace k17 {

using namespace ox;

namespace {

unsigned g_FpsLimit = 50;
bool g_ShowFps = false;
wstring g_ShowFpsFont;

constexpr int kSourceWidth = 1024;
constexpr int kSourceHeight = 768;

// Points a standard stream at a file in the working folder. The file is opened first, so a
// folder that cannot be written leaves the stream where it was.
bool Redirect(int stream, const char* file)
{
    int fd = open(file, O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    if (fd < 0)
        return false;
    fflush(stream == STDOUT_FILENO ? stdout : stderr);
    bool ok = dup2(fd, stream) >= 0;
    close(fd);
    return ok;
}

// The texture declarations stay for the whole run: the texture manager reads them in place.
core::CTextureDeclarationsLoader& TextureDeclarations()
{
    static auto* loader = new core::CTextureDeclarationsLoader();
    return *loader;
}

// The texture declarations go to the texture manager, then the alpha masks are read. A
// declaration file that cannot be used leaves the manager empty; the game goes on.
void LoadTextures()
{
    core::CTextureManager& manager = core::CTextureManager::Instance();
    if (TextureDeclarations().Load())
        manager.Load(&TextureDeclarations());
    manager.GetTexturesAlpha().Load();
}

// The sound declarations become the audio manager's sounds; the loader is needed only
// while they are made.
void LoadSounds()
{
    sound::SoundDeclarationsLoader loader;
    if (loader.Load())
        sound::CAudioManager::Instance().LoadDeclarations(loader);
}

} // namespace

CApp::CApp() = default;

CApp::~CApp()
{
    replay::SetReplayFileStateProbe(nullptr);
    m_Demo.reset();
    core::CFontManager::Instance().SetTextureLookup(nullptr);
    gui::GetGuiServices().findFont = nullptr;
    gui::GetGuiServices().isSound = nullptr;
    SetEffectsSettings(nullptr);
    misc::anim::GetClipServices() = misc::anim::ClipServices();
    CloseOutput();
    m_GameFolder.clear();
    m_Lua.reset();
    m_MainTimer.Reset(nullptr);
}

unsigned CApp::GetFpsLimit() { return g_FpsLimit; }
bool CApp::IsShowFps() { return g_ShowFps; }

void CApp::ReadGameFolder() { m_GameFolder = misc::sys::GetCurrentDirectory(); }

void CApp::RedirectOutput()
{
    m_OutputRedirected = Redirect(STDOUT_FILENO, "k17_stdout.txt");
    if (!Redirect(STDERR_FILENO, "k17_stderr.txt"))
        OX_LOG("app", diag::LogWarning, "cannot redirect the standard error to k17_stderr.txt");
    // Lines reach the file as they are written, as a console would show them.
    setvbuf(stdout, nullptr, _IOLBF, 0);
}

void CApp::CloseOutput()
{
    if (!m_OutputRedirected)
        return;
    fflush(stdout);
    fflush(stderr);
    m_OutputRedirected = false;
}

// The framework's script vocabulary, then the game's and the quest tree.
void CApp::BindScripts()
{
    // A level's host gets the mini-games too, from qe.StartLevel.
    qe::SetLevelBinder([main = m_Lua.get()](lua::CLua& level) {
        level.BeginBinding();
        level.Bind(kminigames::BindMiniGames(main));
        level.EndBinding();
    });
    core::BindOX(*m_Lua);
    m_Lua->BeginBinding();
    m_Lua->Bind(BindGameClasses());
    m_Lua->Bind(BindGameGlobals());
    m_Lua->Bind(BindDemoShell());
    m_Lua->Bind(kminigames::BindMiniGames(m_Lua.get()));
    m_Lua->Bind(qe::BindQuestClasses());
    m_Lua->EndBinding();
}

bool CApp::Init()
{
    // Later subsystems join the start here, in this order: the framework's, the game's and
    // the quest engine's script vocabularies with the main script host; after show_fps
    // the particle declarations, before the clips; after the textures the sound declarations;
    // after the fonts the quest data and the edit widget's forbidden characters.
    lua::SetLuaHeapSize(0x1400000);
    misc::anim::g_LoadInvisibleObjects = false;
    auto adapter = std::make_unique<core::CStandaloneApplicationSdl>(false);
    m_Adapter = adapter.get();
    SetSystemIntegration(std::move(adapter));
    LimitFPS(50);
    if (!CApplication::Init()) {
        m_InitFailure = m_Adapter->IsSecondInstance() ? InitFailure::SecondInstance : InitFailure::Platform;
        return false;
    }
    RedirectOutput();

    m_MainTimer = core::GetTimeManager().AttachGroupTimer("main", nullptr);

    for (const char* file : {"properties/constants.xml", "properties/effects.xml", "properties/guitemplates.xml",
                             "properties/gui.xml"})
        m_Settings.LoadXml(file);
    // Windows open and close with the effects of properties/effects.xml.
    SetEffectsSettings(&m_Settings.GetChild("Effects"));
    RegisterWindowEffects();

    // The quest's widget kinds, and the scene widget and game cursor serving the quest tree.
    qe::RegisterQuestWidgets(gui::GetWidgetFactory());
    qe::ConnectQuestServices();
    qe::ConnectEffectsServices();
    qe::RegisterAlphaImageWidget(gui::GetWidgetFactory());
    kminigames::RegisterMiniGameWidget(gui::GetWidgetFactory());
    m_Lua = std::make_unique<lua::CLua>("main", true);
    BindScripts();
    // A check of the replay compares the brief state of the level shown beside the frames.
    replay::SetReplayFileStateProbe([this] { return HashShownLevelState(m_WidgetManager.GetMainWindow()); });

    wstring saves = misc::sys::AppendPath(m_AppDataFolder, u"saves");
    if (!misc::sys::CheckExistPath(saves) && misc::sys::CreateFolder(saves))
        misc::sys::SetNamedFullAccess(saves, false);

    m_Renderer.SetSourceResolution(kSourceWidth, kSourceHeight);
    LoadPlayerFiles(saves);
    RegisterDemoShellWidgets();
    m_Demo = std::make_unique<CDemoScene>(m_Renderer);

    m_Lua->LoadScript("scripts/main.lua");
    lua::CallLuaFunction(m_Lua.get(), "Init");

    const core::CSettingsGroup& settings = m_Settings.GetChild("settings");
    g_ShowFps = false;
    core::ReadBool(settings, "show_fps", g_ShowFps);
    if (g_ShowFps)
        core::ReadWString(settings, "show_fps_font", g_ShowFpsFont);

    // Particle systems find their textures among the declared ones when they start.
    core::CParticlesLoader::Instance().Load();
    graphics::CParticleSystem::SetTextureLookup(
        [](const char* id) -> const graphics::CTexture* { return core::CTextureManager::Instance().GetItem(id); });
    misc::anim::CClipsLoader::Instance().Load();
    m_ResourceDeclarations.Load("properties/fonts.xml", nullptr);
    LoadTextures();
    m_Demo->TakeDeclaredTextures();
    LoadSounds();
    // A font finds its glyph image among the declared textures by its image id.
    core::CFontManager& fonts = core::CFontManager::Instance();
    fonts.SetTextureLookup([](const char* id) -> const graphics::CTexture* {
        return core::CTextureManager::Instance().GetItem(id);
    });
    fonts.LoadGroup(m_ResourceDeclarations, nullptr);
    // Labels and check boxes write with the declared fonts.
    gui::GetGuiServices().findFont = [](const char* id) -> const graphics::CFont* {
        return core::CFontManager::Instance().GetItem(id);
    };
    gui::GetGuiServices().isSound = [](const std::string& id) { return sound::CAudioManager::Instance().IsSound(id.c_str()); };
    // The quest: the pack's compiled form, or quest.xml compiled now. Levels are built from it
    // on demand, binding their textures and clips.
    qe::g_QuestData::Instance().Load();
    // Clips draw the declared textures and fonts.
    misc::anim::ClipServices& clips = misc::anim::GetClipServices();
    clips.textures = [](const char* id) -> const graphics::CTexture* {
        return core::CTextureManager::Instance().GetItem(id);
    };
    clips.fonts = [](const char* id) -> const graphics::CFont* { return core::CFontManager::Instance().GetItem(id); };
    m_ClipAudio = std::make_unique<misc::anim::CClipAudio>(sound::CAudioManager::Instance());
    clips.sounds = m_ClipAudio.get();
    m_Demo->StartClip();
    gui::CBaseWidget::SetDebugRender(core::ReadBool(settings, "debug_render"));
    m_Demo->LoadPanel(m_Settings.GetChild("gui"), m_Settings.GetChild("GUITemplates"));
    return true;
}

// The player's options and profiles; the options of the current profile open the window in
// the saved mode and set the volumes. Then the records.
void CApp::LoadPlayerFiles(const wstring& saves)
{
    const core::CSettingsGroup& constants = m_Settings.GetChild("Constants");
    CGameOptions& options = g_GameOptions::Instance();
    options.SetDefaults(constants);
    CProfileManager& profiles = g_ProfileManager::Instance();
    profiles.SetSavesFolder(saves);
    options.SetFolder(saves);
    options.Load();
    profiles.Load();
    options.ApplyOptionsChanges();
    options.ApplyMusicChanges();
    CRecordTable& records = g_RecordTable::Instance();
    records.SetDefaultName(core::ReadWString(constants.GetChild("records_window"), "def_player_name"));
    records.SetFolder(saves);
    records.Load();
}

gui::BaseWindowPtrT CApp::CreateLoadWindow()
{
    gui::BaseWindowPtrT window(new CLoadWindow(*this));
    const core::CSettingsGroup& node = m_Settings.GetChildByAttribute("window", "id", "loading", true);
    if (&node == &core::CSettingsGroup::Empty())
        OX_LOG("data", diag::LogWarning, "no <window id=\"loading\"> in the GUI description: the first window is empty");
    window->Load(node, m_Settings.GetChild("GUITemplates"));
    return window;
}

void CApp::OnLoadComplete()
{
    gui::CCursor& cursor = gui::CCursor::Instance();
    cursor.EnableCustomCursors(true);
    cursor.Refresh();
    if (m_Lua)
        lua::CallLuaFunction(m_Lua.get(), "Run");
}

void CApp::OnStop()
{
    if (m_Lua)
        lua::CallLuaFunction(m_Lua.get(), "quest.OnClose");
    CApplication::OnStop();
}

void CApp::ProcessEvent()
{
    core::SystemEvent* event = m_SystemIntegration->GetCurrentEvent();
    if (event->message == core::WM_KEYDOWN && m_DebugLevel >= core::DebugLight) {
        if (event->wParam == core::VK_PRIOR && g_FpsLimit < 50)
            g_FpsLimit += 5;
        else if (event->wParam == core::VK_NEXT && g_FpsLimit > 5)
            g_FpsLimit -= 5;
        if (event->wParam == core::VK_PRIOR || event->wParam == core::VK_NEXT)
            LimitFPS(g_FpsLimit);
    }
    CApplication::ProcessEvent();
}

void CApp::DoDraw(graphics::CRenderer* renderer)
{
    // The test scene under the windows.
    if (m_Demo)
        m_Demo->Draw(*renderer, m_MainTimer.Get() ? m_MainTimer.Get()->GetTime() : 0);
    CApplication::DoDraw(renderer);
    DrawFps(renderer);
}

void CApp::DrawFps(graphics::CRenderer* renderer)
{
    if (m_DebugLevel <= core::DebugNone || !g_ShowFps)
        return;
    // Program-lifetime state of the overlay: the font once found, the frames of the current
    // second, the count shown, and the clock of the seconds.
    static const graphics::CFont* font = nullptr;
    static unsigned frames = 0;
    static unsigned shown = 0;
    static core::CTimer* timer = nullptr;
    static unsigned lastSecond = 0;
    if (!font)
        font = core::CFontManager::Instance().GetItem(misc::ConvertToNarrow(g_ShowFpsFont).c_str());
    if (!font)
        return;
    ++frames;
    if (!timer) {
        timer = core::GetTimeManager().AttachTimer(core::GetTimeManager().GetRoot());
        lastSecond = timer->GetTime();
    }
    if (timer->GetTime() >= lastSecond + 1000) {
        shown = frames;
        frames = 0;
        lastSecond = timer->GetTime();
    }
    wchar buffer[255];
    misc::StringFormat(buffer, 255, u"%d", static_cast<int>(shown));
    renderer->RenderString(font, buffer, 0, 0, graphics::JustifyLeft, graphics::JustifyTop, 1.0f,
                           graphics::Color(0xFFFFFFFFu), graphics::Color(0u));
}

void CApp::DoUpdate()
{
    if (m_Lua)
        m_Lua->CheckFileChanges();
    qe::g_LuaThreadManager::Instance().ManageThreads();
    qe::g_EffectsList::Instance().Update();
    if (m_Demo)
        m_Demo->Update(m_MainTimer.Get() ? m_MainTimer.Get()->GetTime() : 0);
    CApplication::DoUpdate();
}

} // namespace k17
