#include "core/ScriptVocabulary.h"

#include "core/Application.h"
#include "core/CoreBinding.h"
#include "diag/Assert.h"
#include "diag/DiagBinding.h"
#include "graphics/GraphicsBinding.h"
#include "graphics/VideoBinding.h"
#include "gui/GuiBinding.h"
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/mluabind/StdBinding.h"
#include "misc/MiscBinding.h"
#include "misc/animation/AnimationBinding.h"
#include "replay/ReplayBinding.h"
#include "sound/SoundBinding.h"

namespace ox::core {

namespace {

void BindScriptHost(lua::CLua* lua)
{
    OX_CHECK_DATA(lua != nullptr);
    BindOX(*lua);
}

// The ground floor's names, the clips and the file watcher: ox.misc and ox.misc.anim.
void BindMiscStep(mluabind::CHost& host)
{
    misc::BindMisc(host);
    misc::anim::BindAnimation(host);
    host.Bind(mluabind::Namespace("ox").Merge(lua::BindFileWatcher()));
}

// std.string, std.wstring, the maths helpers, and ox.lua with CLua and BindOX itself.
void BindLuaStep(mluabind::CHost& host)
{
    host.Bind(mluabind::BindStdStrings());
    host.Bind(lua::BindStdMaths());
    host.Bind(mluabind::Namespace("ox").Merge(
        lua::BindLuaClasses().AddFunction(mluabind::Function("BindOX", &BindScriptHost))));
}

using Binder = void (*)(mluabind::CHost&);

// In this order.
constexpr Binder kBinders[] = {
    &BindCore, &graphics::BindGraphics, &graphics::BindVideo, &BindMiscStep, &BindLuaStep, &gui::BindGuiVocabulary,
    &sound::BindSound, &replay::BindReplay, &diag::BindDiag,
};

} // namespace

void BindOX(mluabind::CHost& host)
{
    for (Binder binder : kBinders) {
        host.BeginBinding();
        binder(host);
        host.EndBinding();
    }
    if (g_Application) {
        host.BeginBinding();
        g_Application->BindScript(host);
        host.EndBinding();
    }
}

} // namespace ox::core
