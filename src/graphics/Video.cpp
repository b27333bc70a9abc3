#include "graphics/Video.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "misc/GamePack.h"

#include <algorithm>

namespace ox::graphics {

VideoServices& GetVideoServices()
{
    static VideoServices services;
    return services;
}

CMainThreadVideo::~CMainThreadVideo() { Release(); }

void CMainThreadVideo::CloseTracks()
{
    m_Tracks[0].Close();
    m_Tracks[1].Close();
    m_Available = false;
}

void CMainThreadVideo::Release()
{
    VideoServices& services = GetVideoServices();
    if (m_Sound && services.stopSound)
        services.stopSound(m_Sound, 0.0f);
    m_Sound = 0;
    CloseTracks();
    m_Buffer.clear();
    m_Buffer.shrink_to_fit();
    const bool hadSurface = m_Surface != nullptr;
    m_Texture = CTexture();
    m_Surface = nullptr;
    if (hadSurface && services.removeUnusedSurfaces)
        services.removeUnusedSurfaces();
    m_Time = m_Duration = m_Width = m_Height = 0;
    m_PauseCount = 0;
    m_FrameWanted = m_Ended = false;
    m_ShownFrame = -1;
}

bool CMainThreadVideo::Load(const char* path, const char* alphaPath)
{
    OX_CHECK_DATA(path != nullptr, false);
    VideoServices& services = GetVideoServices();
    misc::CGamePack& pack = services.pack ? *services.pack : misc::g_GamePack::Instance();
    CloseTracks();
    m_HasAlphaTrack = m_Translucent && alphaPath && *alphaPath;
    bool ok = m_Tracks[0].Open(path, pack) && (!m_HasAlphaTrack || m_Tracks[1].Open(alphaPath, pack));
    if (ok && !Step()) {
        OX_LOG("video", diag::LogError, "%s: no picture in the video", path);
        ok = false;
    }
    const unsigned w = m_Tracks[0].Width(), h = m_Tracks[0].Height();
    if (ok) {
        m_Width = w, m_Height = h;
        m_Buffer.assign(static_cast<size_t>(w) * h, m_Translucent ? 0u : 0xFF000000u);
        ok = Convert();
    }
    if (ok && m_Surface && (m_Surface->GetWidth() != w || m_Surface->GetHeight() != h)) {
        m_Texture = CTexture();
        m_Surface = nullptr;
    }
    if (ok && !m_Surface) {
        m_Surface = services.createSurface ? services.createSurface(w, h) : nullptr;
        if (!m_Surface)
            OX_LOG("video", diag::LogError, "%s: no surface of %ux%u for the video", path, w, h);
        else
            m_Texture = CTexture(m_Surface);
        ok = m_Surface != nullptr;
    }
    if (!ok) {
        Release();
        return false;
    }
    m_Duration = m_Tracks[0].Duration();
    m_Time = 0;
    m_Ended = false;
    m_Available = m_FrameWanted = true;
    return true;
}

bool CMainThreadVideo::Step()
{
    for (;;) {
        const CVideoTrack::Result colour = m_Tracks[0].DecodeNext();
        if (colour == CVideoTrack::kEnd)
            return false;
        if (m_HasAlphaTrack)
            m_Tracks[1].DecodeNext();
        if (colour == CVideoTrack::kFrame)
            return true;
    }
}

bool CMainThreadVideo::Convert()
{
    th_ycbcr_buffer colour, alpha;
    if (!m_Tracks[0].Planes(colour))
        return false;
    const TheoraPicture& picture = m_Tracks[0].Picture();
    if (m_HasAlphaTrack) {
        const TheoraPicture& other = m_Tracks[1].Picture();
        if (other.width != picture.width || other.height != picture.height) {
            OX_LOG("video", diag::LogError, "%s: the alpha track %s is %ux%u, the video %ux%u",
                   m_Tracks[0].Name().c_str(), m_Tracks[1].Name().c_str(), other.width, other.height,
                   picture.width, picture.height);
            return false;
        }
        if (!m_Tracks[1].Planes(alpha))
            return false;
    }
    TheoraYuvToRgb(colour, picture, m_Buffer.data(), picture.width,
                   m_Translucent && !m_HasAlphaTrack ? kAlphaOpaque : kAlphaKeep);
    if (m_HasAlphaTrack)
        TheoraLumaToAlpha(alpha, m_Tracks[1].Picture(), m_Buffer.data(), picture.width);
    m_ShownFrame = m_Tracks[0].Frame();
    return true;
}

void CMainThreadVideo::AdvanceTo(unsigned ms)
{
    while (!m_Ended && m_Tracks[0].TimeOf(m_Tracks[0].Frame() + 1) <= ms) {
        if (Step())
            continue;
        m_Ended = true;
        if (!m_Cycle || m_Duration == 0)
            CloseTracks();
    }
}

void CMainThreadVideo::Update()
{
    if (!m_Available)
        return;
    if (m_PauseCount == 0) {
        const int delta = GetVideoServices().frameDelta ? GetVideoServices().frameDelta() : 0;
        m_Time += static_cast<unsigned>(std::max(delta, 0));
    }
    if (!m_Ended && m_Time >= m_Tracks[0].TimeOf(m_Tracks[0].Frame() + 1))
        m_FrameWanted = true;
}

void CMainThreadVideo::Draw(CRenderer& renderer, float x, float y, float w, float h)
{
    if (!m_Available)
        return;
    if (m_FrameWanted) {
        AdvanceTo(m_Time);
        if (m_Available && m_Cycle && m_Ended)
            MoveToTime(m_Time - m_Duration);
        if (m_Available && Convert())
            m_Surface->LoadBits(m_Buffer.data(), m_Buffer.size() * 4, m_Width, m_Height, FormatA8R8G8B8);
        m_FrameWanted = false;
    }
    if (!m_Available)
        return;
    if (w < 0 || h < 0) {
        w = m_Surface->GetWidth();
        h = m_Surface->GetHeight();
    }
    renderer.RenderTexture(&m_Texture, misc::FloatRect(x, y, w, h), 0);
}

void CMainThreadVideo::MoveToTime(unsigned ms)
{
    if (!m_Available || ms > m_Duration || ms == m_Time)
        return;
    VideoServices& services = GetVideoServices();
    if (m_Sound && services.seekSound)
        services.seekSound(m_Sound, static_cast<float>(ms) / 1000.0f);
    m_Ended = false;
    if (ms < m_Tracks[0].FrameTime()) {
        bool ok = m_Tracks[0].Rewind() && (!m_HasAlphaTrack || m_Tracks[1].Rewind());
        if (!ok) {
            CloseTracks();
            return;
        }
    }
    m_Time = ms;
    AdvanceTo(ms);
    m_FrameWanted = true;
}

void CMainThreadVideo::Pause()
{
    OX_ASSERT(m_Available);
    if (!m_Available)
        return;
    VideoServices& services = GetVideoServices();
    if (m_PauseCount++ == 0 && m_Sound && services.pauseSound)
        services.pauseSound(m_Sound, true);
}

void CMainThreadVideo::Resume()
{
    OX_ASSERT(m_Available);
    OX_ASSERT(m_PauseCount > 0);
    if (!m_Available || m_PauseCount == 0)
        return;
    VideoServices& services = GetVideoServices();
    if (--m_PauseCount == 0 && m_Sound && services.pauseSound)
        services.pauseSound(m_Sound, false);
}

bool CMainThreadVideo::AttachSound(const char* id)
{
    VideoServices& services = GetVideoServices();
    if (!m_Available || !id || !services.playSound)
        return false;
    if (m_Sound && services.stopSound)
        services.stopSound(m_Sound, 0.0f);
    m_Sound = services.playSound(id, m_Cycle ? -1 : 1);
    if (m_Sound && m_PauseCount > 0 && services.pauseSound)
        services.pauseSound(m_Sound, true);
    return m_Sound != 0;
}

void CMainThreadVideo::CycleAfterEnd(bool cycle)
{
    m_Cycle = cycle;
    VideoServices& services = GetVideoServices();
    if (m_Sound && services.repeatSound)
        services.repeatSound(m_Sound, cycle ? -1 : 1);
}

} // namespace ox::graphics
