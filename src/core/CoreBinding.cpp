#include "core/CoreBinding.h"

#include "core/Application.h"
#include "core/FontManager.h"
#include "core/TextureManager.h"
#include "core/TimeManager.h"

#include <boost/shared_ptr.hpp>

namespace ox::core {

namespace {

using mluabind::Class;
using mluabind::Constant;
using mluabind::Function;

// The platforms a script can tell apart; this build runs as the desktop one.
enum Platform : int { OX_Unknown = 0, OX_Windows = 1, OX_MacOSX = 2, OX_iPhone = 3 };

mluabind::i::GenericClass& ApplicationClass()
{
    using A = CApplication;
    return Class<A>("CApplication")
        .Method("Load", &A::Load)
        .Method("SetMainWindow", [](A& a, gui::CBaseWindow* w) { a.SetMainWindow(gui::BaseWindowPtrT(w)); },
                mluabind::Adopt(1))
        .Method("GetMainWindow", &A::GetMainWindow)
        .Method("GetTopWindow", &A::GetTopWindow)
        .Method("ChangeScreenMode", &A::ChangeScreenMode)
        .Method("GetAppDataFolder", &A::GetAppDataFolder)
        .Method("Shutdown", &A::Shutdown)
        .Method("Stop", &A::Stop)
        .Method("GetSettings", [](A& a) -> CSettings& { return a.GetSettings(); })
        .Method("GetSettings", [](const A& a) -> const CSettings& { return const_cast<A&>(a).GetSettings(); })
        .Method("GetResourceDeclarations", [](A& a) -> CResourceDeclarations& { return a.GetResourceDeclarations(); })
        .Method("GetResourceDeclarations",
                [](const A& a) -> const CResourceDeclarations& { return const_cast<A&>(a).GetResourceDeclarations(); })
        .Method("GetTimeManager", [](A&) { return &GetTimeManager(); })
        .Method("GetRenderer", [](A& a) { return a.GetRenderer(); })
        .Method("GetRenderer", [](const A& a) -> const graphics::CRenderer* { return const_cast<A&>(a).GetRenderer(); })
        .Method("GetTextureManager", [](A&) { return &CTextureManager::Instance(); })
        .Method("GetFontManager", [](A&) { return &CFontManager::Instance(); })
        .Method("GetAudioManager", &A::GetAudioManager)
        .Method("GetWidgetManager", [](A& a) -> gui::CWidgetManager& { return a.GetWidgetManager(); })
        .Method("GetWidgetManager",
                [](const A& a) -> const gui::CWidgetManager& { return const_cast<A&>(a).GetWidgetManager(); })
        .Method("GetDebugLevel", &A::GetDebugLevel)
        .Method("SetDebugLevel", &A::SetDebugLevel)
        .Method("LimitFPS", &A::LimitFPS)
        .Constant("DebugNone", DebugNone)
        .Constant("DebugCheats", DebugCheats)
        .Constant("DebugLight", DebugLight)
        .Constant("DebugHeavy", DebugHeavy);
}

mluabind::Namespace ManagerClasses()
{
    using T = CTextureManager;
    using F = CFontManager;
    mluabind::Namespace ns;
    ns.AddClass(Class<CResourceDeclarations>("CResourceDeclarations"));
    ns.AddClass(Class<T>("CTextureManager")
                    .Method("GetItem", static_cast<graphics::CTexture* (T::*)(const char*)>(&T::GetItem))
                    .Method("GetItem", static_cast<graphics::CTexture* (T::*)(const std::string&)>(&T::GetItem))
                    .Method("GetItemId", &T::GetItemId)
                    .Method("PreloadSurfacesByPrefix", &T::PreloadSurfacesByPrefix)
                    .Method("StopSurfacesPreloading", &T::StopSurfacesPreloading)
                    .Method("UnloadAllOnDemandSurfaces", &T::UnloadAllOnDemandSurfaces));
    // A font's id, or the id a name stands for when a font of that name was declared.
    ns.AddClass(Class<F>("CFontManager")
                    .Method("GetItem", [](F& m, const char* id) { return m.GetItem(id); })
                    .Method("GetItem", [](const F& m, const char* id) { return m.GetItem(id); })
                    .Method("GetItemId",
                            [](const F& m, const graphics::CFont* font) {
                                InternedId id = m.GetItemId(font);
                                return id ? id->c_str() : nullptr;
                            })
                    .Method("GetItemId", [](const F& m, const char* name) -> const char* {
                        const graphics::CFont* font = m.GetItem(name);
                        return font ? m.GetItemId(font)->c_str() : nullptr;
                    }));
    return ns;
}

mluabind::i::GenericClass& SettingsGroupClass()
{
    using G = CSettingsGroup;
    using S = G::String;
    return Class<G>("CSettingsGroup")
        .Constructor<>()
        .Method("GetId", &G::GetId)
        .Method("AddChild", &G::AddChild)
        .Method("RemoveChild", &G::RemoveChild)
        .Method("EnumChildren", &G::EnumChildren)
        .Method("GetFirstChild", &G::GetFirstChild)
        .Method("GetFirstChildRef", &G::GetFirstChildRef)
        .Method("GetChild", &G::GetChild)
        .Method("GetChildRef", &G::GetChildRef)
        .Method("GetChildByAttribute", &G::GetChildByAttribute)
        .Method("GetChildByAttributeRef", &G::GetChildByAttributeRef)
        .Method("GetNamedChild", &G::GetNamedChild)
        .Method("GetNamedChildRef", &G::GetNamedChildRef)
        .Method("GetNextSibling", &G::GetNextSibling)
        .Method("GetNextSiblingRef", &G::GetNextSiblingRef)
        .Method("AddValue", static_cast<void (G::*)(const S&, const std::string&)>(&G::AddValue))
        .Method("AddValue", static_cast<void (G::*)(const char*, const char*)>(&G::AddValue))
        .Method("IsValue", &G::IsValue)
        .Method("GetValue", &G::GetValue)
        .Method("EnumAttributes", &G::EnumAttributes)
        .Method("GetAttribute", &G::GetAttribute)
        .Method("CopyTo", &G::CopyTo);
}

mluabind::Namespace SettingsClasses()
{
    mluabind::Namespace ns;
    ns.AddClass(SettingsGroupClass());
    ns.AddClass(Class<SettingsGroupPtrT>("SettingsGroupPtrT")
                    .Constructor<>()
                    .Method("get", [](const SettingsGroupPtrT& p) { return p.get(); })
                    .ConvertsTo<CSettingsGroup>([](SettingsGroupPtrT& p) { return p.get(); }));
    ns.AddClass(Class<CSettings>("CSettings")
                    .BaseClass<CSettingsGroup>()
                    .Method("LoadXml", &CSettings::LoadXml)
                    .Method("LoadXmlDirect", &CSettings::LoadXmlDirect));
    return ns;
}

// The clock methods both kinds of timer share.
template <class T>
mluabind::i::CCl<T>& TimerClass(const char* name)
{
    return Class<T>(name)
        .Method("GetK", &T::GetK)
        .Method("SetK", &T::SetK)
        .Method("GetTime", &T::GetTime)
        .Method("SetTime", &T::SetTime)
        .Method("GetFrameDelta", &T::GetFrameDelta)
        .Method("Pause", &T::Pause)
        .Method("IsPaused", &T::IsPaused)
        .Method("Destroy", &T::Destroy);
}

template <class T>
mluabind::i::GenericClass& TimerWrapperClass(const char* name)
{
    using W = CBasicTimerWrapper<T>;
    return Class<W>(name)
        .template Constructor<>()
        .template Constructor<T*>()
        .Method("Get", [](W& w) { return w.Get(); })
        .Method("Get", [](const W& w) { return w.Get(); });
}

CGroupTimer* GetRootGroupTimer() { return GetTimeManager().GetRoot(); }

} // namespace

mluabind::Namespace BindTimers()
{
    using M = CTimeManager;
    mluabind::Namespace ns("core");
    ns.AddClass(TimerClass<CTimer>("CTimer"));
    ns.AddClass(TimerClass<CGroupTimer>("CGroupTimer")
                    .Method("GetId", &CGroupTimer::GetId)
                    .Method("AttachTimer", &CGroupTimer::AttachTimer)
                    .Method("AttachGroupTimer", &CGroupTimer::AttachGroupTimer)
                    .Method("GetChildGroupTimer", &CGroupTimer::GetChildGroupTimer));
    ns.AddClass(TimerWrapperClass<CTimer>("CTimerWrapper"));
    ns.AddClass(TimerWrapperClass<CGroupTimer>("CGroupTimerWrapper"));
    ns.AddClass(Class<M>("CTimeManager")
                    .Method("Pause", &M::Pause)
                    .Method("GetTime", &M::GetTime)
                    .Method("GetAppTime", &M::GetAppTime)
                    .Method("AttachTimer", &M::AttachTimer)
                    .Method("AttachGroupTimer", &M::AttachGroupTimer)
                    .Method("GetTimer", &M::GetTimer)
                    .Method("RemoveTimer", &M::RemoveTimer)
                    .Method("RemoveGroupTimer", &M::RemoveGroupTimer));
    // The root of the time tree: where scripts find the clocks of their threads.
    ns.AddFunction(Function("GetRootGroupTimer", &GetRootGroupTimer));
    return ns;
}

void BindCore(mluabind::CHost& host)
{
    mluabind::Namespace core("core");
    core.AddClass(ApplicationClass());
    core.Merge(ManagerClasses()).Merge(SettingsClasses());
    for (auto [name, value] : {std::pair{"OX_Unknown", OX_Unknown}, {"OX_Windows", OX_Windows},
                               {"OX_MacOSX", OX_MacOSX}, {"OX_iPhone", OX_iPhone}})
        core.AddConstant(Constant(name, static_cast<int>(value)));
    core.AddConstant(Constant("g_Application", g_Application));
    core.AddConstant(Constant("g_OXPlatform", static_cast<int>(OX_Windows)));
    host.Bind(mluabind::Namespace("ox").Merge(core).Merge(BindTimers()));
    // Also globals of every state that has the framework's names.
    host.Bind(mluabind::Namespace()
                  .AddConstant(Constant("g_Application", g_Application))
                  .AddConstant(Constant("g_OXPlatform", static_cast<int>(OX_Windows))));
}

} // namespace ox::core
