#pragma once
// Videos decoded on the main thread: COpaqueVideo (one Theora track) and CTranslucentVideo
// (a colour track and an optional alpha track whose luma is the alpha). Each frame due is
// decoded in Draw, converted into a software buffer and loaded into a dynamic surface;
// frames that fall behind the clock are decoded but never converted. Time comes from the
// application's frame delta; a declared sound can be attached.
#include "graphics/Texture.h"
#include "graphics/VideoTrack.h"

#include <cstdint>
#include <functional>
#include <vector>

namespace ox::core {
class CGroupTimer;
}
namespace ox::misc {
class CGamePack;
}

namespace ox::graphics {

class CRenderer;

// What videos get from the floors above: the files, the texture manager's dynamic surfaces,
// the application's frame delta and the audio manager. The application fills it in.
struct VideoServices {
    misc::CGamePack* pack = nullptr;  // null: the process-wide pack
    std::function<CSurface*(unsigned width, unsigned height)> createSurface;
    std::function<void()> removeUnusedSurfaces;
    std::function<int()> frameDelta;  // milliseconds of the current frame
    // A video player's group timer by id; empty: the time manager's.
    std::function<core::CGroupTimer*(const char* id)> findTimer;
    // A declared sound played `repeat` times (-1: for ever); 0 when it did not start.
    std::function<uint32_t(const char* id, int repeat)> playSound;
    std::function<void(uint32_t handle, float fade)> stopSound;
    std::function<void(uint32_t handle, bool pause)> pauseSound;
    std::function<void(uint32_t handle, float seconds)> seekSound;
    std::function<void(uint32_t handle, int repeat)> repeatSound;
};
VideoServices& GetVideoServices();

class CMainThreadVideo {
public:
    virtual ~CMainThreadVideo();
    CMainThreadVideo(const CMainThreadVideo&) = delete;
    CMainThreadVideo& operator=(const CMainThreadVideo&) = delete;

    // Stops the sound, closes the file, drops the texture and the surface.
    void Release();
    bool AttachSound(const char* id);
    CTexture* GetTexture() { return m_Surface ? &m_Texture : nullptr; }
    void Draw(CRenderer& renderer, float x, float y) { Draw(renderer, x, y, -1.0f, -1.0f); }
    // A negative width or height takes the video's.
    void Draw(CRenderer& renderer, float x, float y, float w, float h);
    void Update();
    unsigned GetTime() const { return m_Time; }
    unsigned GetDuration() const { return m_Duration; }
    // Counted: the first Pause stops the clock and the sound, the Resume that brings the
    // count back to 0 starts them.
    void Pause();
    void Resume();
    void MoveToTime(unsigned ms);
    unsigned GetWidth() const { return m_Width; }
    unsigned GetHeight() const { return m_Height; }
    void CycleAfterEnd(bool cycle);

    bool IsAvailable() const { return m_Available; }
    bool IsEnded() const { return m_Ended; }
    // The number of the frame in the buffer (-1 before the first), and the buffer.
    int64_t GetShownFrame() const { return m_ShownFrame; }
    const std::vector<uint32_t>& GetPixels() const { return m_Buffer; }

protected:
    explicit CMainThreadVideo(bool translucent) : m_Translucent(translucent) {}
    bool Load(const char* path, const char* alphaPath);

private:
    bool Convert();
    // Decodes the next frame of every track, skipping refused packets; false at the end of
    // the colour track.
    bool Step();
    void AdvanceTo(unsigned ms);
    void CloseTracks();

    const bool m_Translucent;
    CVideoTrack m_Tracks[2];
    bool m_HasAlphaTrack = false;
    std::vector<uint32_t> m_Buffer;
    CSurface* m_Surface = nullptr;
    CTexture m_Texture;
    unsigned m_Width = 0, m_Height = 0;
    unsigned m_Time = 0, m_Duration = 0;
    unsigned m_PauseCount = 0;
    bool m_Available = false, m_FrameWanted = false, m_Ended = false, m_Cycle = false;
    int64_t m_ShownFrame = -1;
    uint32_t m_Sound = 0;
};

class COpaqueVideo : public CMainThreadVideo {
public:
    COpaqueVideo() : CMainThreadVideo(false) {}
    bool LoadFromFile(const char* path) { return Load(path, nullptr); }
};

// Without an alpha track the picture is opaque.
class CTranslucentVideo : public CMainThreadVideo {
public:
    CTranslucentVideo() : CMainThreadVideo(true) {}
    bool LoadFromFile(const char* path) { return Load(path, nullptr); }
    bool LoadFromFile(const char* path, const char* alphaPath) { return Load(path, alphaPath); }
};

} // namespace ox::graphics
