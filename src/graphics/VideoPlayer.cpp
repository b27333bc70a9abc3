#include "graphics/VideoPlayer.h"

#include "core/TimeManager.h"
#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "graphics/Video.h"
#include "misc/GamePack.h"

#include <algorithm>
#include <cstring>

namespace ox::graphics {

namespace {

CVideoPlayer* g_CurrentVideo = nullptr;
float g_VideoVolume = 100.0f;

TheoraVideoManager& Manager()
{
    static CBassInterfaceFactory factory;
    TheoraVideoManager& manager = TheoraVideoManager::getSingleton();
    if (!manager.getAudioInterfaceFactory()) {
        manager.setAudioInterfaceFactory(&factory);
        manager.setLogFunction([](const std::string& text) { OX_LOG("video", diag::LogInfo, "%s", text.c_str()); });
    }
    return manager;
}

} // namespace

// Data source ------------------------------------------------------------------------------

CMemMapDataSource::~CMemMapDataSource()
{
    if (m_Data)
        m_Pack.Close(m_Data);
}

bool CMemMapDataSource::Open(const char* path)
{
    unsigned size = 0;
    m_Data = static_cast<const uint8_t*>(m_Pack.Open(path, &size));
    m_Size = size;
    return m_Data != nullptr;
}

int CMemMapDataSource::read(void* buffer, int bytes)
{
    const uint64_t n = std::min<uint64_t>(bytes < 0 ? 0 : bytes, m_Size - m_Position);
    memcpy(buffer, m_Data + m_Position, n);
    m_Position += n;
    return static_cast<int>(n);
}

// Audio --------------------------------------------------------------------------------------

CBassInterface::CBassInterface(TheoraVideoClip* owner, int channels, int frequency)
    : TheoraAudioInterface(owner, channels, frequency),
      m_Buffer(static_cast<size_t>(std::max(1, frequency * channels))),
      m_MaxBufferSize(m_Buffer.size())
{
    // No stream: the video's clock stays the clip's own timer.
    OX_LOG("video", diag::LogInfo, "%s: its sound track is not played (video sound comes from AttachSound)",
           owner->getName().c_str());
}

void CBassInterface::insertData(float** data, int samples)
{
    for (int i = 0; i < samples; ++i)
        for (int c = 0; c < m_NumChannels; ++c) {
            if (m_Used == m_MaxBufferSize)
                Flush();
            m_Buffer[m_Used++] = data[c][i];
        }
    Flush();
}

void CBassInterface::Flush()
{
    m_Dropped += m_Used;
    m_Used = 0;
}

void CBassInterface::update(float seconds)
{
    if (m_Volume != g_VideoVolume)
        m_Volume = g_VideoVolume;
    TheoraTimer::update(seconds);
    if (m_Owner->getDuration() > 0 && getTime() > m_Owner->getDuration())
        seek(m_Owner->getDuration());
}

void SetVideoVolume(float volume) { g_VideoVolume = volume; }

void PauseCurrentVideo()
{
    if (g_CurrentVideo && g_CurrentVideo->GetClip())
        g_CurrentVideo->GetClip()->getTimer()->pause();
}

void ResumeCurrentVideo()
{
    if (g_CurrentVideo && g_CurrentVideo->GetClip())
        g_CurrentVideo->GetClip()->getTimer()->play();
}

// Player -------------------------------------------------------------------------------------

namespace {

core::CGroupTimer* FindTimer(const char* id)
{
    if (GetVideoServices().findTimer)
        return GetVideoServices().findTimer(id ? id : "");
    return id && *id ? core::GetTimeManager().GetTimer(id) : core::GetTimeManager().GetRoot();
}

} // namespace

CVideoPlayer::CVideoPlayer(const char* timerId) : m_Timer(FindTimer(timerId)), m_Manager(Manager())
{
    if (!m_Timer)
        OX_LOG("video", diag::LogError, "video player: no timer \"%s\"; the video stands still", timerId);
    g_CurrentVideo = this;
}

CVideoPlayer::~CVideoPlayer()
{
    Close();
    if (g_CurrentVideo == this)
        g_CurrentVideo = nullptr;
}

CVideoPlayer* CVideoPlayer::GetCurrent() { return g_CurrentVideo; }

void CVideoPlayer::Close()
{
    m_Manager.destroyVideoClip(m_VideoClip);
    m_Manager.destroyVideoClip(m_AlphaVideoClip);
    m_VideoClip = m_AlphaVideoClip = nullptr;
    m_Stacked = false;
    const bool hadSurface = m_Surface != nullptr;
    m_Texture = CTexture();
    m_Surface = nullptr;
    if (hadSurface && GetVideoServices().removeUnusedSurfaces)
        GetVideoServices().removeUnusedSurfaces();
}

TheoraVideoClip* CVideoPlayer::OpenClip(const char* path)
{
    OX_CHECK_DATA(path != nullptr, nullptr);
    misc::CGamePack* pack = GetVideoServices().pack;
    auto source = std::make_unique<CMemMapDataSource>(pack ? *pack : misc::g_GamePack::Instance());
    if (!source->Open(path)) {
        OX_LOG("video", diag::LogError, "%s: cannot read the video", path);
        return nullptr;
    }
    try {
        return m_Manager.createVideoClip(source.release(), 2, 0, false);
    } catch (const _TheoraGenericException& e) {
        OX_LOG("video", diag::LogError, "%s: %s: %s", path, e.getType().c_str(), e.getErrorText().c_str());
    }
    return nullptr;
}

bool CVideoPlayer::MakeSurface(unsigned width, unsigned height, const char* path)
{
    VideoServices& services = GetVideoServices();
    m_Surface = services.createSurface ? services.createSurface(width, height) : nullptr;
    if (!m_Surface) {
        OX_LOG("video", diag::LogError, "%s: no surface of %ux%u for the video", path, width, height);
        Close();
        return false;
    }
    m_Texture = CTexture(m_Surface);
    const std::vector<uint32_t> zero(static_cast<size_t>(width) * height);
    m_Surface->LoadBits(zero.data(), zero.size() * 4, width, height, FormatA8R8G8B8);
    return true;
}

bool CVideoPlayer::LoadFromFile(const char* path)
{
    Close();
    m_VideoClip = OpenClip(path);
    return m_VideoClip && MakeSurface(m_VideoClip->getWidth(), m_VideoClip->getHeight(), path);
}

bool CVideoPlayer::LoadFromFile(const char* path, const char* alphaPath)
{
    if (!LoadFromFile(path))
        return false;
    m_AlphaVideoClip = OpenClip(alphaPath);
    if (m_AlphaVideoClip && (m_VideoClip->getWidth() != m_AlphaVideoClip->getWidth() ||
                             m_VideoClip->getHeight() != m_AlphaVideoClip->getHeight())) {
        OX_LOG("video", diag::LogError, "%s: the alpha video %s is %ux%u, the video %ux%u", path, alphaPath,
               m_AlphaVideoClip->getWidth(), m_AlphaVideoClip->getHeight(), m_VideoClip->getWidth(),
               m_VideoClip->getHeight());
        Close();
        return false;
    }
    if (!m_AlphaVideoClip)
        Close();
    return m_AlphaVideoClip != nullptr;
}

bool CVideoPlayer::LoadFromFileAlpha(const char* path)
{
    Close();
    m_VideoClip = OpenClip(path);
    if (!m_VideoClip)
        return false;
    if (m_VideoClip->getHeight() % 2 != 0) {
        OX_LOG("video", diag::LogError, "%s: a stacked video needs an even height, not %u", path,
               m_VideoClip->getHeight());
        Close();
        return false;
    }
    m_Stacked = true;
    return MakeSurface(m_VideoClip->getWidth(), m_VideoClip->getHeight() / 2, path);
}

bool CVideoPlayer::IsTransparent(int x, int y) const
{
    if (!m_VideoClip || (!m_AlphaVideoClip && !m_Stacked) || !m_Surface || !m_Surface->GetBuffer())
        return false;
    OX_CHECK_DATA(x >= 0 && x < m_Surface->GetWidth(), false);
    OX_CHECK_DATA(y >= 0 && y < m_Surface->GetHeight(), false);
    return m_Surface->GetBuffer()[static_cast<size_t>(y) * m_Surface->GetWidth() + x] < 0x1000000u;
}

unsigned CVideoPlayer::GetWidth() const { return m_VideoClip ? m_VideoClip->getWidth() : 0; }

unsigned CVideoPlayer::GetHeight() const
{
    return m_VideoClip ? (m_Stacked ? m_VideoClip->getHeight() / 2 : m_VideoClip->getHeight()) : 0;
}

float CVideoPlayer::GetTime() const { return m_VideoClip ? m_VideoClip->getTimer()->getTime() * 1000.0f : 0.0f; }

float CVideoPlayer::GetDuration() const { return m_VideoClip ? m_VideoClip->getDuration() * 1000.0f : 0.0f; }

void CVideoPlayer::Draw(CRenderer& renderer, float x, float y)
{
    Draw(renderer, x, y, static_cast<float>(GetWidth()), static_cast<float>(GetHeight()));
}

void CVideoPlayer::Draw(CRenderer& renderer, float x, float y, float w, float h)
{
    if (m_Surface && m_VideoClip)
        renderer.RenderTexture(&m_Texture, misc::FloatRect(x, y, w, h), 0);
}

void CVideoPlayer::Update()
{
    m_Manager.update(m_Timer ? static_cast<float>(std::max(0, m_Timer->GetFrameDelta())) / 1000.0f : 0.0f);
    if (!m_Surface || !m_VideoClip)
        return;
    TheoraVideoFrame* frame = m_VideoClip->getNextFrame();
    if (!frame)
        return;
    const size_t pixels = static_cast<size_t>(m_Surface->GetWidth()) * m_Surface->GetHeight();
    const uint32_t* colour = frame->getBuffer();
    if (m_AlphaVideoClip || m_Stacked) {
        TheoraVideoFrame* alphaFrame = m_Stacked ? frame : m_AlphaVideoClip->getNextFrame();
        if (alphaFrame) {
            const uint32_t* alpha = alphaFrame->getBuffer() + (m_Stacked ? pixels : 0);
            m_Surface->CreateBuffer();
            uint32_t* out = m_Surface->GetBuffer();
            for (size_t i = 0; i < pixels; ++i)
                out[i] = (colour[i] & 0xFFFFFFu) | ((alpha[i] & 0xFF0000u) << 8);
            m_Surface->CommitBits();
            if (!m_Stacked)
                m_AlphaVideoClip->popFrame();
        }
    } else {
        m_Surface->LoadBits(colour, pixels * 4, m_Surface->GetWidth(), m_Surface->GetHeight(), FormatA8R8G8B8);
    }
    m_VideoClip->popFrame();
}

} // namespace ox::graphics
