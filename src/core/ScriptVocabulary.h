#pragma once
// The framework's script vocabulary, whole: the roof list of the binders of every subsystem.
namespace mluabind {
class CHost;
}

namespace ox::core {

// What scripts know as ox.lua.BindOX(lua): runs the binders core, graphics, misc, lua, gui,
// sound, replay and diag in that order, each in declaration mode of its own, then the
// application's binder (CApplication::BindScript) when there is an application. A class is
// bound after its bases, which is why the order matters. Binding again replaces the names.
void BindOX(mluabind::CHost& host);

} // namespace ox::core
