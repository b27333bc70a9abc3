#pragma once
// The binding layer: include this to declare and publish native classes for Lua.
#include "lua/mluabind/Binding.h"
#include "lua/mluabind/Host.h"
