#include "graphics/VideoBinding.h"

#include "graphics/Renderer.h"
#include "graphics/Video.h"
#include "graphics/VideoPlayer.h"

namespace ox::graphics {

namespace {

using mluabind::Class;

mluabind::i::GenericClass& PlayerClass()
{
    using P = CVideoPlayer;
    return Class<P>("CVideoPlayer")
        .Constructor<const char*>()
        .Method("LoadFromFile", static_cast<bool (P::*)(const char*)>(&P::LoadFromFile))
        .Method("LoadFromFile", static_cast<bool (P::*)(const char*, const char*)>(&P::LoadFromFile))
        .Method("LoadFromFileAlpha", &P::LoadFromFileAlpha)
        .Method("IsTransparent", &P::IsTransparent)
        .Method("GetWidth", &P::GetWidth)
        .Method("GetHeight", &P::GetHeight)
        .Method("Draw", static_cast<void (P::*)(CRenderer&, float, float)>(&P::Draw))
        .Method("Draw", static_cast<void (P::*)(CRenderer&, float, float, float, float)>(&P::Draw))
        .Method("Update", &P::Update)
        .Method("GetDuration", &P::GetDuration)
        .Method("GetTime", &P::GetTime);
}

// The names the two main-thread videos share.
template <class V>
mluabind::i::CCl<V>& MainThreadClass(const char* name)
{
    return Class<V>(name)
        .template Constructor<>()
        .Method("Release", [](V& v) { v.Release(); })
        .Method("AttachSound", [](V& v, const char* id) { return v.AttachSound(id); })
        .Method("GetTexture", [](V& v) { return v.GetTexture(); })
        .Method("GetWidth", [](V& v) { return v.GetWidth(); })
        .Method("GetHeight", [](V& v) { return v.GetHeight(); })
        .Method("Draw", [](V& v, CRenderer& r, float x, float y) { v.Draw(r, x, y); })
        .Method("Draw", [](V& v, CRenderer& r, float x, float y, float w, float h) { v.Draw(r, x, y, w, h); })
        .Method("Update", [](V& v) { v.Update(); })
        .Method("GetDuration", [](V& v) { return v.GetDuration(); })
        .Method("GetTime", [](V& v) { return v.GetTime(); })
        .Method("Pause", [](V& v) { v.Pause(); })
        .Method("Resume", [](V& v) { v.Resume(); })
        .Method("MoveToTime", [](V& v, unsigned ms) { v.MoveToTime(ms); })
        .Method("CycleAfterEnd", [](V& v, bool cycle) { v.CycleAfterEnd(cycle); });
}

} // namespace

void BindVideo(mluabind::CHost& host)
{
    mluabind::Namespace graphics("graphics");
    graphics.AddClass(PlayerClass());
    graphics.AddClass(MainThreadClass<COpaqueVideo>("COpaqueVideo")
                          .Method("LoadFromFile", [](COpaqueVideo& v, const char* path) { return v.LoadFromFile(path); }));
    graphics.AddClass(MainThreadClass<CTranslucentVideo>("CTranslucentVideo")
                          .Method("LoadFromFile", [](CTranslucentVideo& v, const char* path, const char* alpha) {
                              return alpha && *alpha ? v.LoadFromFile(path, alpha) : v.LoadFromFile(path);
                          }));
    host.Bind(mluabind::Namespace("ox").Merge(graphics));
}

} // namespace ox::graphics
