#pragma once
// Walks a table of expected script names (shaped like tests/lua/vocabulary.lua) in a host:
// the walk itself is vocabulary.lua's, with probes that ask the host's class registry for
// classes, overload counts and members.
#include "lua/mluabind/Host.h"

#include <string>

namespace oxtest {

struct GroupResult {
    int wanted = 0;
    int found = 0;
    std::string problems;
};

// Runs the walk of `walker` (a file returning a table with `walk`) over the group `group`
// ("required", "pending.video", ...) of the table that the file `names` returns.
GroupResult WalkVocabulary(mluabind::CHost& host, const std::string& walker, const std::string& names,
                           const std::string& group);

} // namespace oxtest
