#pragma once
// The Lua side of the checks: compiling a chunk as the game's hosts would (without running
// it), and finding the calls whose first argument is written as a literal.
#include <string>
#include <vector>

namespace oxlint {

// Compiles `text`; on failure returns false and sets `line` (1-based within `text`, 0 when
// the compiler names none) and `what`.
bool CompileLua(const std::string& text, unsigned& line, std::string& what);

// A call `name("literal"` or `name(123` or `name "literal"` found in a script.
struct LiteralCall {
    std::string name;     // the last name before the bracket: "Play" for audio.Play(...)
    std::string literal;  // the first argument, string contents or the number as written
    bool number = false;
    unsigned line = 0;
};

// Every string literal of the script, with its line, and the literal calls.
struct LuaLiterals {
    std::vector<std::pair<std::string, unsigned>> strings;
    std::vector<LiteralCall> calls;
};

// Reads a script's tokens: comments are skipped, strings decoded only as far as the checks
// need (escapes are kept as written).
LuaLiterals ScanLua(const std::string& text);

} // namespace oxlint
