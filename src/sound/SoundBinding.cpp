#include "sound/SoundBinding.h"

#include "sound/AudioManager.h"

namespace ox::sound {

mluabind::Namespace BindAudioManager()
{
    using mluabind::Class;
    using M = CAudioManager;
    using Handle = M::Handle;
    mluabind::Namespace ns("core");
    ns.AddClass(Class<M>("CAudioManager")
                    .Method("IsAudioAvailable", &M::IsAudioAvailable)
                    .Method("PauseAll", &M::PauseAll)
                    .Method("GetGlobalVolume", &M::GetGlobalVolume)
                    .Method("SetGlobalVolume", &M::SetGlobalVolume)
                    .Method("SetVolume", static_cast<bool (M::*)(const char*, float, float, float)>(&M::SetVolume))
                    .Method("SetVolume", static_cast<bool (M::*)(Handle, float, float, float)>(&M::SetVolume))
                    .Method("GetVolume", static_cast<float (M::*)(const char*) const>(&M::GetVolume))
                    .Method("GetVolume", static_cast<float (M::*)(Handle) const>(&M::GetVolume))
                    .Method("GetMaxVolume", &M::GetMaxVolume)
                    .Method("GetPosition", &M::GetPosition)
                    .Method("SetPosition", &M::SetPosition)
                    .Method("GetPriority", &M::GetPriority)
                    .Method("GetRepeatCount", static_cast<int (M::*)(Handle) const>(&M::GetRepeatCount))
                    .Method("GetBalance", &M::GetBalance)
                    .Method("GetSpeed", &M::GetSpeed)
                    .Method("GetLength", static_cast<double (M::*)(const char*) const>(&M::GetLength))
                    .Method("Play", &M::Play)
                    .Method("StopAll", &M::StopAll)
                    .Method("Stop", static_cast<bool (M::*)(const char*, float)>(&M::Stop))
                    .Method("Stop", static_cast<bool (M::*)(Handle, float)>(&M::Stop))
                    .Method("IsSound", static_cast<bool (M::*)(const char*) const>(&M::IsSound))
                    .Method("IsSound", static_cast<bool (M::*)(Handle) const>(&M::IsSound))
                    .Method("SetGroupVolume", &M::SetGroupVolume)
                    .Method("GetGroupVolume", &M::GetGroupVolume)
                    .Method("StopGroup", &M::StopGroup)
                    .Method("UnloadAllOnDemandSounds", &M::UnloadAllOnDemandSounds));
    ns.AddFunction(mluabind::Function("CAudioManager.Instance", &M::Instance));
    return ns;
}

void BindSound(mluabind::CHost& host)
{
    host.Bind(mluabind::Namespace("ox").Merge(BindAudioManager()));
    // "ox" stands: the audio manager was just bound under it.
    lua_State* L = host.GetLuaState();
    lua_getglobal(L, "ox");
    lua_getfield(L, -1, "sound");
    const bool missing = lua_isnil(L, -1);
    lua_pop(L, 1);
    if (missing) {
        lua_newtable(L);
        lua_setfield(L, -2, "sound");
    }
    lua_pop(L, 1);
}

} // namespace ox::sound
