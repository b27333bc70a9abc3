#include "misc/animation/ClipServices.h"

#include "core/TimeManager.h"

namespace ox::misc::anim {

ClipServices& GetClipServices()
{
    static ClipServices services;
    return services;
}

core::CTimeManager& ClipTimeManager()
{
    core::CTimeManager* time = GetClipServices().time;
    return time ? *time : core::GetTimeManager();
}

} // namespace ox::misc::anim
