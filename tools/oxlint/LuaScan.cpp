#include "oxlint/LuaScan.h"

#include <lua.hpp>

#include <cctype>
#include <cstdlib>

namespace oxlint {

bool CompileLua(const std::string& text, unsigned& line, std::string& what)
{
    lua_State* lua = luaL_newstate();
    if (!lua) {
        line = 0;
        what = "no memory for a Lua state";
        return false;
    }
    const bool compiled = luaL_loadbuffer(lua, text.data(), text.size(), "=chunk") == 0;
    if (!compiled) {
        // "chunk:12: message"
        std::string message = lua_tostring(lua, -1) ? lua_tostring(lua, -1) : "unknown error";
        line = 0;
        what = message;
        const size_t colon = message.find(':');
        if (message.rfind("chunk:", 0) == 0 && colon != std::string::npos) {
            char* end = nullptr;
            const unsigned long number = strtoul(message.c_str() + colon + 1, &end, 10);
            if (end && *end == ':') {
                line = static_cast<unsigned>(number);
                what = end + 1;
                while (!what.empty() && what.front() == ' ')
                    what.erase(0, 1);
            }
        }
    }
    lua_close(lua);
    return compiled;
}

namespace {

class Scanner {
public:
    explicit Scanner(const std::string& text) : m_Text(text) {}

    LuaLiterals Run()
    {
        while (m_At < m_Text.size())
            Step();
        return std::move(m_Out);
    }

private:
    // "[[", "[=[" ...: the level of a long bracket at m_At, or -1.
    int LongBracketLevel(size_t at) const
    {
        if (at >= m_Text.size() || m_Text[at] != '[')
            return -1;
        size_t p = at + 1;
        int level = 0;
        while (p < m_Text.size() && m_Text[p] == '=')
            ++p, ++level;
        return p < m_Text.size() && m_Text[p] == '[' ? level : -1;
    }

    // Skips a long bracket at m_At; returns its contents.
    std::string LongBracket(int level)
    {
        const std::string close = "]" + std::string(level, '=') + "]";
        const size_t begin = m_At + level + 2;
        size_t end = m_Text.find(close, begin);
        if (end == std::string::npos)
            end = m_Text.size();
        std::string contents = m_Text.substr(begin, end - begin);
        Advance(std::min(m_Text.size(), end + close.size()));
        return contents;
    }

    void Advance(size_t to)
    {
        for (; m_At < to; ++m_At)
            if (m_Text[m_At] == '\n')
                ++m_Line;
    }

    std::string QuotedString()
    {
        const char quote = m_Text[m_At];
        std::string contents;
        size_t p = m_At + 1;
        while (p < m_Text.size() && m_Text[p] != quote && m_Text[p] != '\n') {
            if (m_Text[p] == '\\' && p + 1 < m_Text.size())
                contents += m_Text[p++];
            contents += m_Text[p++];
        }
        Advance(std::min(m_Text.size(), p + 1));
        return contents;
    }

    void Literal(const std::string& value, unsigned line, bool number)
    {
        if (!number)
            m_Out.strings.emplace_back(value, line);
        // A call: a name, then "(" and this literal, or the literal right after the name.
        if (!m_LastName.empty() && (m_OpenAfterName || !number))
            m_Out.calls.push_back({m_LastName, value, number, line});
        m_LastName.clear();
        m_OpenAfterName = false;
    }

    void Step()
    {
        const char c = m_Text[m_At];
        const unsigned line = m_Line;
        if (c == '-' && m_Text.compare(m_At, 2, "--") == 0) {
            const int level = LongBracketLevel(m_At + 2);
            if (level >= 0) {
                Advance(m_At + 2);
                LongBracket(level);
            } else {
                const size_t end = m_Text.find('\n', m_At);
                Advance(end == std::string::npos ? m_Text.size() : end);
            }
            return;
        }
        if (c == '"' || c == '\'') {
            Literal(QuotedString(), line, false);
            return;
        }
        const int level = LongBracketLevel(m_At);
        if (level >= 0) {
            Literal(LongBracket(level), line, false);
            return;
        }
        if (isalpha(static_cast<unsigned char>(c)) || c == '_') {
            size_t end = m_At;
            while (end < m_Text.size() && (isalnum(static_cast<unsigned char>(m_Text[end])) || m_Text[end] == '_'))
                ++end;
            m_LastName = m_Text.substr(m_At, end - m_At);
            m_OpenAfterName = false;
            Advance(end);
            return;
        }
        if (isdigit(static_cast<unsigned char>(c))) {
            size_t end = m_At;
            while (end < m_Text.size() && (isalnum(static_cast<unsigned char>(m_Text[end])) || m_Text[end] == '.'))
                ++end;
            Literal(m_Text.substr(m_At, end - m_At), line, true);
            Advance(end);
            return;
        }
        if (isspace(static_cast<unsigned char>(c))) {
            Advance(m_At + 1);
            return;
        }
        if (c == '(' && !m_LastName.empty() && !m_OpenAfterName) {
            m_OpenAfterName = true;
        } else {
            m_LastName.clear();
            m_OpenAfterName = false;
        }
        Advance(m_At + 1);
    }

    const std::string& m_Text;
    size_t m_At = 0;
    unsigned m_Line = 1;
    std::string m_LastName;
    bool m_OpenAfterName = false;
    LuaLiterals m_Out;
};

} // namespace

LuaLiterals ScanLua(const std::string& text) { return Scanner(text).Run(); }

} // namespace oxlint
