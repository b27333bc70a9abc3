// Standard types as bound classes: std.string, std.wstring, containers and iterators.
#include "lua/LuaTestHost.h"

#include "lua/mluabind/StdBinding.h"
#include "support/TestSupport.h"

#include <list>
#include <vector>

using namespace mluabind;
using oxtest::LuaTestHost;

namespace {

std::string g_Name;
std::u16string g_WideName;
std::vector<int> g_Numbers{1, 2, 3};

class StdTypes : public ::testing::Test {
protected:
    void SetUp() override
    {
        g_Numbers = {1, 2, 3};
        host.Declare([] {
            Namespace ns;
            ns.Merge(BindStdStrings());
            Namespace test("test");
            test.Merge(VectorClass<int>("IntVector"));
            test.Merge(ListClass<std::string>("StringList"));
            test.AddClass(GenericIteratorClass<std::vector<int>>("IntIterator"));
            test.AddFunction(Function("SetName", [](const std::string& name) { g_Name = name; }));
            test.AddFunction(Function("GetName", [] { return g_Name; }));
            test.AddFunction(Function("NameRef", []() -> const std::string& { return g_Name; }));
            test.AddFunction(Function("SetWide", [](const std::u16string& name) { g_WideName = name; }));
            test.AddFunction(Function("GetWide", [] { return g_WideName; }));
            test.AddFunction(Function("WideText", [] { return g_WideName.c_str(); }));
            test.AddFunction(Function("Numbers", []() -> std::vector<int>& { return g_Numbers; }));
            test.AddFunction(Function("Walk", [] { return ox::misc::CGenericIterator<std::vector<int>>(&g_Numbers); }));
            test.AddFunction(Function("WalkNothing", [] { return ox::misc::CGenericIterator<std::vector<int>>(); }));
            ns.Merge(test);
            return ns;
        });
    }
    LuaTestHost host;
};

TEST_F(StdTypes, StringsCrossAsBoundObjects)
{
    // A Lua string reaches a const string& by implicit construction.
    host.Run("test.SetName('h\\195\\169llo')");
    EXPECT_EQ(g_Name, "h\xc3\xa9llo");
    EXPECT_EQ(host.Run("local s = test.GetName() return __get_typeex(s) .. ' ' .. s.c_str() .. ' ' .. s.length()"),
              "std.string owned h\xc3\xa9llo 6");
    EXPECT_EQ(host.Run("local s = test.NameRef() s.append('!') return __get_typeex(s)"), "std.string const");
    EXPECT_EQ(host.Run("local s = std.string('abc') s.append('def') s.append(2, 'x') s.insert(0, 'A') "
                       "return s.c_str() .. ' ' .. s.substr(1, 3).c_str() .. ' ' .. s.find('d', 0, 1)"),
              "Aabcdefxx abc 4");
    // "d" is both a one-character string and a text: find(char, pos) and find(const char*, pos) tie.
    EXPECT_EQ(host.Run("local s = std.string('abc') return s.find('b', 0)"), "nil");
    EXPECT_NE(host.LastReport().find("Caused by: ambiguity.\n"), std::string::npos);
    EXPECT_EQ(host.Run("return std.string('abc').find('bc', 0) .. ' ' .. tostring(std.string.npos == std.string('a').find('z', 0, 1))"),
              "1 true");
    // A count beyond the text is cut to it.
    EXPECT_EQ(host.Run("local s = std.string() s.append('ab', 100) return s.c_str()"), "ab");
    // A native exception (position out of range) is a report; the script goes on.
    EXPECT_EQ(host.Run("local s = std.string('ab') s.erase(5, 1) return 'on'"), "on");
    EXPECT_NE(host.LastReport().find("native exception"), std::string::npos);

    host.Run("test.SetWide('\\208\\175!')");
    EXPECT_EQ(g_WideName, u"\u042f!");
    EXPECT_EQ(host.Run("local w = test.GetWide() return w.c_str() .. w.length() .. w.at(0)"), "\xd0\xaf!21071");
    EXPECT_EQ(host.Run("local w = std.wstring('ab') w.push_back(67) return w.c_str()"), "abC");
}

TEST_F(StdTypes, WideTextLimits)
{
    oxtest::AssertCapture asserts;
    // A wide text returned to Lua arrives whole, however long; a surrogate pair stays one
    // character, wherever the text falls.
    auto repeat = [](auto unit, size_t count) {
        decltype(unit) text;
        while (count-- > 0)
            text += unit;
        return text;
    };
    std::pair<std::u16string, std::string> texts[] = {
        {repeat(std::u16string(u"\u0416"), 512), repeat(std::string("\xd0\x96"), 512)},
        {repeat(std::u16string(u"\U0001F600"), 20000), repeat(std::string("\xf0\x9f\x98\x80"), 20000)},
        {u"a" + repeat(std::u16string(u"\U0001F600"), 20000), "a" + repeat(std::string("\xf0\x9f\x98\x80"), 20000)},
    };
    for (auto& [wide, narrow] : texts) {
        g_WideName = wide;
        lua_pushlstring(host.GetLuaState(), narrow.data(), narrow.size());
        lua_setglobal(host.GetLuaState(), "expected");
        EXPECT_EQ(host.Run("return test.WideText() == expected"), "true") << narrow.size();
    }
    // 511 bytes pass to a wide parameter; 512 don't fit the conversion buffer: a report,
    // and the script goes on.
    host.Run("test.SetWide(string.rep('a', 511))");
    EXPECT_EQ(g_WideName.size(), 511u);
    EXPECT_TRUE(host.Reports.empty());
    EXPECT_EQ(host.Run("test.SetWide(string.rep('b', 512)) return 'went on'"), "went on");
    EXPECT_EQ(g_WideName, std::u16string(511, u'a')) << "the function doesn't run";
    EXPECT_EQ(host.LastReport(),
              "PM::ExtractParam: error - a text of 512 bytes is too long for a wide parameter (at most 511).\n");
    EXPECT_EQ(asserts.Count(), 0u);
}

TEST_F(StdTypes, ContainersAndIterators)
{
    EXPECT_EQ(host.Run("local v = test.Numbers() v.push_back(4) return v.size() .. v.at(3) .. v.front() .. v.back()"), "4414");
    EXPECT_EQ(g_Numbers.size(), 4u);
    EXPECT_EQ(host.Run("local v = test.Numbers() local sum, it = 0, v.begin() "
                       "while not (it == v._end()) do sum = sum + it.value it = it + 1 end return sum"),
              "10");
    EXPECT_EQ(host.Run("local v = test.Numbers() local it = v.begin() + 1 it.value = 20 return g_ok or v.at(1)"), "20");
    EXPECT_EQ(host.Run("local v = test.Numbers() local it = v.begin() return tostring(it < it + 1) .. tostring(it + 1 <= it)"),
              "truefalse");
    EXPECT_EQ(host.Run("local v = test.Numbers() v.erase(v.begin()) v.insert(v._end(), 2, 7) return v.size() .. v.back()"),
              "57");
    // A const iterator's value has no setter.
    EXPECT_EQ(host.Run("local v = __const(test.Numbers()) local it = v.begin() it.value = 1 return 'on'"), "on");
    EXPECT_EQ(host.LastReport(), "FreePropertyClass::PerformNewIndexOperator: can't assign - no setter available.\n");
    EXPECT_EQ(host.Run("return __get_type(test.Numbers().rbegin()) .. ' ' .. __get_type(__const(test.Numbers()).rend())"),
              "test.IntVector.reverse_iterator test.IntVector.const_reverse_iterator");

    EXPECT_EQ(host.Run("local l = test.StringList() l.push_back('b') l.push_front('a') l.push_back('c') l.reverse() "
                       "local out = '' local it = l.begin() out = it.value.c_str() return out .. l.size() .. l.back().c_str()"),
              "c3a");

    EXPECT_EQ(host.Run("local it, out = test.Walk(), '' while not it.IsEnd() do out = out .. it.Get() it.Next() end return out"),
              "203477");
    EXPECT_EQ(host.Run("return tostring(test.WalkNothing().IsEnd())"), "true");
}

} // namespace
