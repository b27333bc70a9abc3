#include "replay/ReplayBinding.h"

#include "replay/Replay.h"

namespace ox::replay {

using mluabind::Class;
using mluabind::Function;

void BindReplay(mluabind::CHost& host)
{
    mluabind::Namespace ns("replay");
    ns.AddClass(Class<CRecord>("CRecord")
                    .Method("Start", &CRecord::Start)
                    .Method("IsRecording", &CRecord::IsRecording)
                    .Method("Stop", &CRecord::Stop)
                    .Method("SaveEvents", &CRecord::SaveEvents));
    ns.AddClass(Class<CPlayback>("CPlayback")
                    .Method("Start", &CPlayback::Start)
                    .Method("IsPlaying", &CPlayback::IsPlaying)
                    .Method("Stop", &CPlayback::Stop)
                    .Method("LoadEvents", &CPlayback::LoadEvents));
    ns.AddFunction(Function("g_Record.Instance", &CRecord::Instance));
    ns.AddFunction(Function("g_Playback.Instance", &CPlayback::Instance));
    host.Bind(mluabind::Namespace("ox").Merge(ns));
}

} // namespace ox::replay
