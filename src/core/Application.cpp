#include "core/Application.h"

#include "core/SettingsReaders.h"
#include "core/TextureManager.h"
#include "core/TimeManager.h"
#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Image.h"
#include "graphics/Video.h"
#include "graphics/VideoPlayer.h"
#include "gui/Cursor.h"
#include "gui/GuiServices.h"
#include "gui/WidgetFactory.h"
#include "lua/Lua.h"
#include "misc/StringTable.h"
#include "misc/Unicode.h"
#include "misc/sys/Path.h"
#include "replay/Replay.h"

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <optional>
#include <thread>

namespace ox::core {

CApplication* g_Application = nullptr;

namespace {

// Videos make their surfaces through the texture manager, take the game's frame delta, play
// their sounds through the audio manager and pause with the game.
void ConnectVideo(MediaPauseHooks& hooks)
{
    graphics::VideoServices& video = graphics::GetVideoServices();
    video.createSurface = [](unsigned w, unsigned h) { return CTextureManager::Instance().CreateSurface(w, h); };
    video.removeUnusedSurfaces = [] { CTextureManager::Instance().RemoveUnusedSurfaces(); };
    video.frameDelta = [] { return CTimeManager::Instance().GetFrameDelta(); };
    auto& audio = sound::CAudioManager::Instance();
    video.playSound = [&audio](const char* id, int repeat) {
        return audio.Play(id, sound::CAudioManager::kKeep, sound::CAudioManager::kKeep, -2, repeat);
    };
    video.stopSound = [&audio](uint32_t handle, float fade) { audio.Stop(handle, fade); };
    video.pauseSound = [&audio](uint32_t handle, bool pause) { audio.Pause(handle, pause); };
    video.seekSound = [&audio](uint32_t handle, float seconds) { audio.SetPosition(handle, seconds); };
    video.repeatSound = [&audio](uint32_t handle, int repeat) { audio.SetRepeatCount(handle, repeat); };
    hooks.video = [](bool pause) { pause ? graphics::PauseCurrentVideo() : graphics::ResumeCurrentVideo(); };
}

wstring UserDataBase()
{
    std::string base;
    const char* xdg = getenv("XDG_DATA_HOME");
    if (xdg && *xdg) {
        base = xdg;
    } else {
        const char* home = getenv("HOME");
        base = std::string(home && *home ? home : ".") + "/.local/share";
    }
    return misc::ConvertToWide(base);
}

bool IsPlainFolderName(const wstring& name)
{
    return !name.empty() && name != u"." && name != u".." && name.find_first_of(u"/\\") == wstring::npos;
}

// With Ctrl and Alt held: P, and 0x70 (the lower-case letter's code, which is F1's key code).
constexpr uint32_t kReplayKeys[] = {0x50, 0x70};

} // namespace

wstring CApplication::UserDataFolder(const wstring& company, const wstring& product)
{
    return misc::sys::AppendPath(misc::sys::AppendPath(UserDataBase(), company), product);
}

wstring CApplication::OwnDataFolder(const wstring& company, const wstring& product)
{
    const wstring& first = company.empty() ? product : company;
    return IsPlainFolderName(first) ? misc::sys::AppendPath(UserDataBase(), first) : wstring();
}

CApplication::CApplication()
{
    // The first use of the time manager creates it.
    srand(static_cast<unsigned>(GetTimeManager().GetTime()));
    g_Application = this;
    // The GUI maps the mouse by where the canvas lies in the window.
    m_Renderer.SetActiveRectListener([this](const misc::FloatRect& rect, const misc::FloatVector& scale) {
        m_WidgetManager.SetActiveRect(rect, scale);
        const misc::IntVector source = m_Renderer.GetSourceResolution();
        if (source.X > 0 && source.Y > 0)
            gui::GetGuiServices().canvas = {static_cast<float>(source.X), static_cast<float>(source.Y)};
    });
    gui::GuiServices& gui = gui::GetGuiServices();
    gui.isActive = [this] { return IsActive(); };
    gui.isFullscreen = [this] { return m_Renderer.IsFullscreen(); };
    // Windows open and close with declared sounds.
    gui.playSound = [](const std::string& id) { sound::PlaySound(id.c_str()); };
    // The replay: recording hears live input, playback stands in for it, Ctrl+Alt+P toggles it.
    m_WidgetManager.SetInputListener(&replay::CRecord::Instance());
    m_WidgetManager.SetInputBlocked([] { return replay::CPlayback::Instance().IsPlaying(); });
    m_ReplayKey = &replay::ToggleReplayFile;

    // The first use of the string table opens the game pack.
    misc::CStringTable::Instance().Load();

    m_Settings.LoadXml("game.xml");
    const CSettingsGroup& settings = m_Settings.GetChild("settings");
    ReadInt(settings, "debug", m_DebugLevel);
    ReadLocalText(settings, "company", m_Company);
    ReadLocalText(settings, "product", m_Product);
    // Ctrl+Alt+P checks its playback against "replay.check", or writes it (the drawn frames only;
    // a game adds its own state).
    replay::SetReplayFileCheck(misc::WideToUtf8(m_Product), {});
    ReadInt(settings, "version", m_Version);
    ReadWString(settings, "full_version", m_FullVersion);
    ReadLocalText(settings, "window_title", m_WindowTitle);
    if (m_WindowTitle.empty()) {
        m_WindowTitle = m_Product + u" ";
        if (!m_FullVersion.empty())
            m_WindowTitle += m_FullVersion;
        else
            m_WindowTitle += misc::FormatWide(u"%i.%i", m_Version / 100, m_Version % 100);
    }

    m_AppDataFolder = UserDataFolder(m_Company, m_Product);
    const wstring ownFolder = OwnDataFolder(m_Company, m_Product);
    CreateDataFolder(ownFolder);

    diag::Log::Instance().SetFile(misc::WideToUtf8(m_AppDataFolder) + "/log.oxlog");
    // The first use of the audio manager starts the sound output; it pauses with the game.
    GetAudioManager();
    m_MediaHooks.audio = [](bool pause) { sound::CAudioManager::Instance().PauseAll(pause); };
    OX_LOG("app", diag::LogInfo, "app created");
    if (ownFolder.empty())
        OX_LOG("data", diag::LogWarning,
               "game.xml: company \"%s\" (product \"%s\") names no folder of the game's own; the data folder's "
               "access stays as created",
               misc::WideToUtf8(m_Company).c_str(), misc::WideToUtf8(m_Product).c_str());
}

void CApplication::CreateDataFolder(const wstring& ownFolder)
{
    misc::sys::SetFullAccessRoot(ownFolder);
    if (misc::sys::CheckExistPath(m_AppDataFolder))
        return;
    misc::sys::CreateFolder(m_AppDataFolder);
    if (!ownFolder.empty())
        misc::sys::SetNamedFullAccess(ownFolder, true);
}

CApplication::~CApplication()
{
    DoShutdown();
    gui::GuiServices& gui = gui::GetGuiServices();
    if (gui.platform == m_SystemIntegration.get())
        gui.platform = nullptr;
    gui.isActive = nullptr;
    gui.isFullscreen = nullptr;
    gui.playSound = nullptr;
    m_Renderer.SetActiveRectListener(nullptr);
    OX_LOG("app", diag::LogInfo, "app destroyed");
    diag::Log::Instance().Flush();
    if (g_Application == this)
        g_Application = nullptr;
}

void CApplication::SetSystemIntegration(std::unique_ptr<CSystemIntegration> adapter)
{
    m_SystemIntegration = std::move(adapter);
    m_Renderer.SetSystemIntegration(m_SystemIntegration.get());
    gui::GetGuiServices().platform = m_SystemIntegration.get();
    if (m_SystemIntegration) {
        m_SystemIntegration->SetClient(this);
        m_SystemIntegration->SetIdentity(misc::WideToUtf8(m_Product), misc::WideToUtf8(m_WindowTitle),
                                         misc::WideToUtf8(m_AppDataFolder));
    }
}

bool CApplication::Init()
{
    OX_LOG("app", diag::LogInfo, "app init...");
    OX_ASSERT(m_SystemIntegration != 0 && "System Integration Adapter should be set before CApplication::Init()");
    if (!m_SystemIntegration)
        return false;
    bool allOnDemand = true;
    ReadBool(m_Settings.GetChild("settings"), "all_on_demand", allOnDemand);
    if (!m_SystemIntegration->CheckSingleInstance())
        return false;
    if (!m_SystemIntegration->Init()) {
        OX_LOG("app", diag::LogError, "error in m_SystemIntegration->Init");
        return false;
    }
    CTextureManager::Instance().SetAllOnDemand(allOnDemand);
    GetAudioManager().SetOnDemand(allOnDemand);
    m_Renderer.AddDeviceResourceOwner(&CTextureManager::Instance());
    graphics::CImage::SetTextureLookup([](const char* id) { return CTextureManager::Instance().GetItem(id); });
    ConnectVideo(m_MediaHooks);
    // The display modes can be listed once the platform layer is up.
    m_Renderer.EnumResolutions();
    gui::RegisterFrameworkWidgets(gui::GetWidgetFactory());
    OX_LOG("app", diag::LogInfo, "app init complete...");
    return true;
}

void CApplication::Run()
{
    if (m_SystemIntegration)
        m_SystemIntegration->Run();
}

void CApplication::Stop()
{
    OnStop();
    if (m_SystemIntegration)
        m_SystemIntegration->Stop();
}

void CApplication::Load()
{
    OX_LOG("app", diag::LogInfo, "loading...");
    m_State = Loading;
    DoLoad();
    if (m_State != ShuttingDown)
        m_State = Running;
    OX_LOG("app", diag::LogInfo, "loading complete");
}

void CApplication::DoLoad()
{
    OX_LOG("app", diag::LogTrace, "CApplication::DoLoad() start");
    OX_LOG("app", diag::LogTrace, "CApplication::DoLoad() end");
}

void CApplication::Update()
{
    if (!IsActive()) {
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        if (m_State != Loading && m_State != LoadingPaused)
            return;
    }
    m_FrameLimiter.Wait();
    replay::CPlayback::Instance().Update(m_WidgetManager);
    graphics::SetFrameNumber(graphics::GetFrameNumber() + 1);
    lua::CLua::StepGarbageCollector(g_FrameTime);
    // The widgets see the frame delta of the previous frame; DoUpdate sees the new one.
    m_WidgetManager.Update();
    GetTimeManager().Update();
    GetAudioManager().SetStatistics(m_DebugLevel >= DebugHeavy);
    GetAudioManager().Update();
    CTextureManager::Instance().UpdatePreload();
    DoUpdate();
    RefreshCursor();
    if (m_ShutdownRequested)
        DoShutdown();
}

void CApplication::Draw()
{
    if (!m_Minimized) {
        if (std::optional<graphics::ModeRequest> mode = m_Renderer.CheckModeRestore())
            ChangeScreenMode(mode->fullscreen, mode->bpp32, mode->width, mode->height);
    }
    if (m_ShutdownDone || m_Minimized || !m_Focused)
        return;
    if (!m_Renderer.BeginScene())
        return;
    DoDraw(&m_Renderer);
    replay::CPlayback::Instance().Draw(m_Renderer);
    replay::CRecord::Instance().Draw(m_Renderer);
    if (IsActive())
        gui::CCursor::Instance().Draw(m_Renderer);
    DrawLetterbox();
    m_Renderer.EndScene();
}

void CApplication::DrawLetterbox()
{
    // Opaque bars over what the canvas does not cover, in source units.
    const misc::FloatRect active = m_Renderer.GetActiveRect();
    const misc::FloatVector scale = m_Renderer.GetScale();
    const misc::IntVector source = m_Renderer.GetSourceResolution();
    const float sw = static_cast<float>(source.X), sh = static_cast<float>(source.Y);
    const graphics::Color black(0xFF000000u);
    if (active.X > 0) {
        const float w = active.X / scale.X;
        m_Renderer.RenderFilledPoly4(misc::RectToPoly4({-w, 0, w, sh}), black);
        m_Renderer.RenderFilledPoly4(misc::RectToPoly4({sw, 0, w, sh}), black);
    } else if (active.Y > 0) {
        const float h = active.Y / scale.Y;
        m_Renderer.RenderFilledPoly4(misc::RectToPoly4({0, -h, sw, h}), black);
        m_Renderer.RenderFilledPoly4(misc::RectToPoly4({0, sh, sw, h}), black);
    }
}

void CApplication::DoDraw(graphics::CRenderer* renderer)
{
    if (renderer)
        m_WidgetManager.Draw(*renderer);
}

void CApplication::Forward(const SystemEvent& event)
{
    // Input reaches the widgets through here alone.
    if (IsActive())
        m_WidgetManager.OnWindowMessage(event);
    if (m_SystemIntegration)
        m_SystemIntegration->DefaultProcess();
}

void CApplication::RefreshCursor()
{
    if (!m_SystemIntegration || m_ShutdownDone)
        return;
    IntPoint pointer = m_SystemIntegration->GetCursorPos();
    m_SystemIntegration->ScreenToClient(pointer);
    const IntRect client = m_SystemIntegration->GetClientRect();
    if (pointer.X >= client.X && pointer.Y >= client.Y && pointer.X < client.X + client.Width &&
        pointer.Y < client.Y + client.Height)
        gui::CCursor::Instance().Refresh();
}

void CApplication::ProcessEvent()
{
    SystemEvent* event = m_SystemIntegration->GetCurrentEvent();
    if (m_ShutdownDone) {
        m_SystemIntegration->DefaultProcess();
        return;
    }
    switch (event->message) {
    case WM_MOVE:
        if (!m_Renderer.IsFullscreen())
            ApplyCursorClip();
        break;
    case WM_SIZE: {
        bool minimized = event->wParam == SIZE_MINIMIZED;
        if (minimized != m_Minimized) {
            m_Minimized = minimized;
            if (minimized && !m_MediaPaused) {
                if (m_MediaHooks.audio)
                    m_MediaHooks.audio(true);
                m_MediaPaused = true;
            } else if (!minimized && m_MediaPaused) {
                if (m_MediaHooks.audio)
                    m_MediaHooks.audio(false);
                m_MediaPaused = false;
            }
        }
        UpdateActivity();
        break;
    }
    case WM_CLOSE:
    case WM_QUIT:
    case WM_ENDSESSION:
        Stop();
        break;
    case WM_ACTIVATEAPP:
        m_Focused = event->wParam != 0;
        UpdateActivity();
        break;
    case WM_SETCURSOR:
        gui::CCursor::Instance().Refresh();
        event->result = 1;
        break;
    case WM_DISPLAYCHANGE:
        OnDisplayChange(*event);
        event->result = 1;
        return;
    case WM_KEYDOWN:
        if (IsReplayKey(*event)) {
            if (m_ReplayKey)
                m_ReplayKey();
            event->result = 1;
            return;
        }
        break;
    default:
        break;
    }
    Forward(*event);
}

bool CApplication::IsReplayKey(const SystemEvent& event) const
{
    return std::find(std::begin(kReplayKeys), std::end(kReplayKeys), event.wParam) != std::end(kReplayKeys) &&
           m_SystemIntegration->IsKeyDown(VK_CONTROL) && m_SystemIntegration->IsKeyDown(VK_MENU);
}

void CApplication::OnDisplayChange(const SystemEvent& event)
{
    const unsigned width = event.lParam & 0xFFFF;
    const unsigned height = event.lParam >> 16;
    const bool bpp32 = event.wParam == 32;
    if (width != m_Renderer.GetWidth() || height != m_Renderer.GetHeight() || bpp32 != m_Renderer.Is32BPP())
        m_Renderer.RequestModeRestore(bpp32);
}

void CApplication::UpdateActivity()
{
    bool wanted = m_Focused && !m_Minimized;
    if (wanted == m_Active)
        return;
    m_Active = wanted;
    if (!(m_State == Loading && !m_Active))
        GetTimeManager().Pause(!m_Active);
    if (m_Active) {
        if (m_State == LoadingPaused)
            m_State = Loading;
        ApplyCursorClip();
        if (m_MediaPaused) {
            if (m_MediaHooks.audio)
                m_MediaHooks.audio(false);
            if (m_MediaHooks.video)
                m_MediaHooks.video(false);
            m_MediaPaused = false;
        }
    } else {
        if (m_Renderer.IsFullscreen() && m_State == Loading)
            m_State = LoadingPaused;
        m_WidgetManager.ReleaseCapture();
        if (m_SystemIntegration) {
            m_SystemIntegration->ClipCursor(nullptr);
            m_SystemIntegration->ShowCursor(true);
        }
        if (!m_MediaPaused) {
            if (m_MediaHooks.audio)
                m_MediaHooks.audio(true);
            if (m_MediaHooks.video)
                m_MediaHooks.video(true);
            m_MediaPaused = true;
        }
    }
    OnActivate(m_Active);
}

void CApplication::SetCursorClip(bool enabled, const misc::IntRect& rect)
{
    m_CursorClipEnabled = enabled;
    m_CursorClipRect = rect;
    if (enabled)
        ApplyCursorClip();
    else if (m_SystemIntegration)
        m_SystemIntegration->ClipCursor(nullptr);
}

void CApplication::ApplyCursorClip()
{
    if (!m_CursorClipEnabled || !m_SystemIntegration)
        return;
    // Source rectangle to window pixels: the platform confines the mouse in client coordinates.
    misc::FloatVector k = m_Renderer.GetScale();
    misc::FloatVector offset = m_Renderer.GetAspectOffset();
    misc::IntRect rect;
    rect.X = static_cast<int>(m_CursorClipRect.X * k.X + offset.X);
    rect.Y = static_cast<int>(m_CursorClipRect.Y * k.Y + offset.Y);
    rect.Width = static_cast<int>(m_CursorClipRect.Width * k.X);
    rect.Height = static_cast<int>(m_CursorClipRect.Height * k.Y);
    m_SystemIntegration->ClipCursor(&rect);
}

bool CApplication::ChangeScreenMode(bool fullscreen, bool bpp32, unsigned width, unsigned height)
{
    const unsigned oldWidth = m_Renderer.GetWidth();
    const unsigned oldHeight = m_Renderer.GetHeight();
    const bool oldBpp32 = m_Renderer.Is32BPP();
    const bool oldFullscreen = m_Renderer.IsFullscreen();

    if (width == 0 || height == 0) {
        m_SystemIntegration->GetDesktopResolution(&width, &height);
        bpp32 = true;
        fullscreen = true;
    }
    if (fullscreen) {
        graphics::ResolutionsT modes;
        m_Renderer.GetAvailableResolutions(modes);
        bool exact = false;
        bool otherDepth = false;
        for (const graphics::Resolution& mode : modes) {
            bool sizeMatches = (mode.Width == width && mode.Height == height) ||
                               (mode.Width == height && mode.Height == width);
            if (!sizeMatches)
                continue;
            if (mode.Bpp32 == bpp32) {
                exact = true;
                break;
            }
            otherDepth = true;
        }
        if (!exact && !otherDepth && !modes.empty()) {
            width = modes.back().Width;
            height = modes.back().Height;
            bpp32 = modes.back().Bpp32;
        } else if (!exact && otherDepth) {
            bpp32 = !bpp32;
        }
    }
    GetTimeManager().Pause(true);
    if (oldFullscreen && !fullscreen)
        m_Renderer.ReleaseDevice(false);
    if (!fullscreen) {
        misc::IntRect outer {0, 0, static_cast<int>(width), static_cast<int>(height)};
        m_SystemIntegration->AdjustRect(outer);
        const float dpiX = 1.0f, dpiY = 1.0f; // no DPI scaling on this platform
        int outerWidth = static_cast<int>(outer.Width * dpiX);
        int outerHeight = static_cast<int>(outer.Height * dpiY);
        width = static_cast<unsigned>(width * dpiX);
        height = static_cast<unsigned>(height * dpiY);
        misc::IntRect work = m_SystemIntegration->GetWorkArea();
        if (work.Width > 0 && work.Height > 0 && (outerWidth > work.Width || outerHeight > work.Height)) {
            int frameWidth = outerWidth - static_cast<int>(width);
            int frameHeight = outerHeight - static_cast<int>(height);
            width = static_cast<unsigned>(work.Width - frameWidth - static_cast<int>(15 * dpiX));
            height = static_cast<unsigned>(work.Height - frameHeight - static_cast<int>(15 * dpiY));
        }
        misc::IntVector source = m_Renderer.GetSourceResolution();
        OX_ASSERT(width && height);
        OX_ASSERT(source.X && source.Y);
        if (width && height && source.X && source.Y) {
            // The aspect fit runs whether or not the window had to shrink.
            float a = static_cast<float>(width) / static_cast<float>(height);
            float s = static_cast<float>(source.X) / static_cast<float>(source.Y);
            if (a - s > 0.01f)
                width = static_cast<unsigned>(width * s / a);
            else if (a - s < 0.01f)
                height = static_cast<unsigned>(height * a / s);
        }
    }
    OX_LOG("app", diag::LogInfo, "change screen mode...");
    bool changed = false;
    if (OnChangeScreenMode(fullscreen, bpp32, width, height) &&
        m_SystemIntegration->SetScreenMode(fullscreen, bpp32, width, height) &&
        m_Renderer.InitWindow(fullscreen, bpp32, width, height)) {
        changed = m_Renderer.GetWidth() != oldWidth || m_Renderer.GetHeight() != oldHeight ||
                  m_Renderer.Is32BPP() != oldBpp32 || m_Renderer.IsFullscreen() != oldFullscreen;
        if (changed)
            OX_LOG("app", diag::LogInfo, "screen mode changed");
    }
    GetTimeManager().Pause(false);
    m_Minimized = false;
    UpdateActivity();
    ApplyCursorClip();
    OX_LOG("app", diag::LogInfo, "change screen mode complete");
    return changed;
}

void CApplication::DoShutdown()
{
    if (m_ShutdownDone)
        return;
    OX_LOG("app", diag::LogTrace, "shutdown...");
    m_State = ShuttingDown;
    m_WidgetManager.Clear();
    m_Renderer.ReleaseDevice(false);
    if (m_SystemIntegration)
        m_SystemIntegration->Shutdown();
    if (m_SystemIntegration)
        m_SystemIntegration->ClipCursor(nullptr);
    LimitFPS(0);
    m_ShutdownDone = true;
    OX_LOG("app", diag::LogInfo, "shutdown complete...");
}

} // namespace ox::core
