#pragma once
// CVideoPlayer: a video decoded ahead by the worker of the threaded video library, the main
// thread taking the frame that is due on its game timer and loading it into a dynamic
// surface. Opaque, with a second clip whose red channel is the alpha, or stacked (the alpha
// in the lower half of each frame).
#include "graphics/Texture.h"
#include "misc/theoraplayer/TheoraPlayer.h"

#include <memory>
#include <string>

namespace ox::core {
class CGroupTimer;
}
namespace ox::misc {
class CGamePack;
}

namespace ox::graphics {

class CRenderer;

// The whole file through the game pack, given back when the source goes.
class CMemMapDataSource : public TheoraDataSource {
public:
    explicit CMemMapDataSource(misc::CGamePack& pack) : m_Pack(pack) {}
    ~CMemMapDataSource() override;
    bool Open(const char* path);
    int read(void* buffer, int bytes) override;
    std::string repr() override { return "memmap"; }
    void seek(uint64_t position) override { m_Position = std::min<uint64_t>(position, m_Size); }
    uint64_t size() override { return m_Size; }
    uint64_t tell() override { return m_Position; }

private:
    misc::CGamePack& m_Pack;
    const uint8_t* m_Data = nullptr;
    uint64_t m_Size = 0, m_Position = 0;
};

// A clip's audio sink and clock in one. The sound layer has no streams for video audio, so
// the decoded samples are dropped and the clock is the plain timer's.
class CBassInterface : public TheoraAudioInterface, public TheoraTimer {
public:
    CBassInterface(TheoraVideoClip* owner, int channels, int frequency);
    void insertData(float** data, int samples) override;
    void update(float seconds) override;
    size_t GetDroppedSamples() const { return m_Dropped; }

private:
    void Flush();
    std::vector<float> m_Buffer;
    size_t m_MaxBufferSize, m_Used = 0, m_Dropped = 0;
    float m_Volume = -1;
};

class CBassInterfaceFactory : public TheoraAudioInterfaceFactory {
public:
    TheoraAudioInterface* createInstance(TheoraVideoClip* owner, int channels, int frequency) override
    {
        return new CBassInterface(owner, channels, frequency);
    }
};

// The volume each new video sound takes, 0 to 100.
void SetVideoVolume(float volume);
// The application's focus: stop and start the clock of the latest player's clip.
void PauseCurrentVideo();
void ResumeCurrentVideo();

class CVideoPlayer {
public:
    // Plays on the group timer `timerId` of the time manager (the root without one).
    explicit CVideoPlayer(const char* timerId = "");
    ~CVideoPlayer();
    CVideoPlayer(const CVideoPlayer&) = delete;
    CVideoPlayer& operator=(const CVideoPlayer&) = delete;

    bool LoadFromFile(const char* path);
    bool LoadFromFile(const char* path, const char* alphaPath);
    bool LoadFromFileAlpha(const char* path);
    bool IsTransparent(int x, int y) const;
    unsigned GetWidth() const;
    unsigned GetHeight() const;
    void Draw(CRenderer& renderer, float x, float y);
    void Draw(CRenderer& renderer, float x, float y, float w, float h);
    void Update();
    float GetTime() const;
    float GetDuration() const;

    TheoraVideoClip* GetClip() const { return m_VideoClip; }
    CTexture* GetTexture() { return m_Surface ? &m_Texture : nullptr; }
    static CVideoPlayer* GetCurrent();

private:
    void Close();
    TheoraVideoClip* OpenClip(const char* path);
    bool MakeSurface(unsigned width, unsigned height, const char* path);

    core::CGroupTimer* m_Timer;
    TheoraVideoManager& m_Manager;
    CSurface* m_Surface = nullptr;
    CTexture m_Texture;
    TheoraVideoClip* m_VideoClip = nullptr;
    TheoraVideoClip* m_AlphaVideoClip = nullptr;
    bool m_Stacked = false;
};

} // namespace ox::graphics
