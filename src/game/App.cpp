#include "game/App.h"

#include "core/SettingsReaders.h"
#include "core/TextureDeclarations.h"
#include "core/TextureManager.h"
#include "diag/Log.h"
#include "misc/Unicode.h"
#include "misc/sys/Path.h"

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

} // namespace

CApp::CApp() = default;

CApp::~CApp()
{
    m_Demo.reset();
    CloseOutput();
    m_GameFolder.clear();
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

bool CApp::Init()
{
    // Later subsystems join the start here, in this order: the Lua heap size, the clip
    // loader's flag; after the settings files the main script host and the bindings; after
    // the window the player's options, profiles, music and records; scripts/main.lua and its
    // Init; then the particle, clip and font declarations (before the textures, below), the
    // sound declarations (after them), the quest data and the edit widget's forbidden
    // characters.
    m_Adapter = std::make_unique<core::CStandaloneApplicationSdl>(false);
    SetSystemIntegration(m_Adapter.get());
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

    wstring saves = misc::sys::AppendPath(m_AppDataFolder, u"saves");
    if (!misc::sys::CheckExistPath(saves)) {
        misc::sys::CreateFolder(saves);
        misc::sys::SetNamedFullAccess(saves, false);
    }

    m_Renderer.SetSourceResolution(kSourceWidth, kSourceHeight);
    // The window opens at the source size until the player's options choose the mode.
    ChangeScreenMode(false, true, kSourceWidth, kSourceHeight);
    m_Demo = std::make_unique<CDemoScene>(m_Renderer);

    const core::CSettingsGroup& settings = m_Settings.GetChild("settings");
    g_ShowFps = false;
    core::ReadBool(settings, "show_fps", g_ShowFps);
    if (g_ShowFps)
        core::ReadWString(settings, "show_fps_font", g_ShowFpsFont);

    LoadTextures();
    m_Demo->TakeDeclaredTextures();
    return true;
}

void CApp::OnStop() { CApplication::OnStop(); }

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
    CApplication::DoDraw(renderer);
    if (m_Demo)
        m_Demo->Draw(*renderer, m_MainTimer.Get() ? m_MainTimer.Get()->GetTime() : 0);
}

void CApp::DoUpdate() { CApplication::DoUpdate(); }

} // namespace k17
