// What the binding layer keeps between calls: an object's own method closures, the names
// a class has resolved, the overload chosen for a set of value types. Each must give what
// a fresh lookup would.
#include "lua/LuaTestHost.h"

#include <string>

using namespace mluabind;
using oxtest::LuaTestHost;

namespace {

struct Lamp {
    static inline int Alive = 0;
    static constexpr int Bright = 7;
    int Level = 1;
    Lamp() { ++Alive; }
    ~Lamp() { --Alive; }
    int GetLevel() const { return Level; }
    int Power() { return Level * 10; }
    int Power() const { return Level; }
    const char* Take(int) { return "int"; }
    const char* Take(const char*) { return "text"; }
    const char* Take(bool) { return "bool"; }
    const char* Take(int, int) { return "two"; }
    bool operator==(const Lamp& other) const { return Level == other.Level; }
};

// A base that doesn't start the object: its methods need the converted pointer.
struct Tag {
    int Mark = 5;
    int GetMark() const { return Mark; }
};
struct TaggedLamp : Lamp, Tag {};

// Two routes to one base; the first adapter in map order is the one taken, for methods
// and members alike.
struct Root {
    int RootValue = 0;
    int GetRootValue() const { return RootValue; }
};
struct Mid1 : Root {};
struct Mid2 : Mid1 {};
struct Other : Root {};
struct Leaf : Mid2, Other {};

Namespace Lamps()
{
    return Namespace()
        .AddClass(Class<Lamp>("Lamp")
                      .Constructor<>()
                      .Member("Level", &Lamp::Level)
                      .Property("Doubled", [](const Lamp& lamp) { return lamp.Level * 2; })
                      .Constant("Bright", Lamp::Bright)
                      .Method("GetLevel", &Lamp::GetLevel)
                      .Method("Power", static_cast<int (Lamp::*)()>(&Lamp::Power))
                      .Method("Power", static_cast<int (Lamp::*)() const>(&Lamp::Power))
                      .Method("Take", static_cast<const char* (Lamp::*)(int)>(&Lamp::Take))
                      .Method("Take", static_cast<const char* (Lamp::*)(const char*)>(&Lamp::Take))
                      .Method("Take", static_cast<const char* (Lamp::*)(bool)>(&Lamp::Take))
                      .Method("Take", static_cast<const char* (Lamp::*)(int, int)>(&Lamp::Take))
                      .Operator(OpEq, &Lamp::operator==))
        .AddClass(Class<Tag>("Tag").Method("GetMark", &Tag::GetMark))
        .AddClass(Class<TaggedLamp>("TaggedLamp").BaseClass<Lamp>().BaseClass<Tag>().Constructor<>())
        .AddClass(Class<Root>("Root").Member("RootValue", &Root::RootValue).Method("GetRootValue", &Root::GetRootValue))
        .AddClass(Class<Mid1>("Mid1").BaseClass<Root>())
        .AddClass(Class<Mid2>("Mid2").BaseClass<Mid1>())
        .AddClass(Class<Other>("Other").BaseClass<Root>())
        .AddClass(Class<Leaf>("Leaf").BaseClass<Mid2>().BaseClass<Other>().Constructor<>())
        .AddFunction(Function("level", [](const Lamp& lamp) { return lamp.Level; }));
}

class Caches : public ::testing::Test {
protected:
    void SetUp() override { host.Declare(Lamps); }

    // Runs a chunk after `lamp` has read methods often enough for Lua to read through its
    // cache.
    std::string RunCached(const std::string& code)
    {
        return host.Run("lamp = Lamp() for k = 1, 8 do lamp.GetLevel() lamp.Power() end " + code);
    }

    LuaTestHost host;
};

TEST_F(Caches, AnObjectWithCachedMethodsReadsEverythingElseAsBefore)
{
    EXPECT_EQ(RunCached("lamp.Level = 3 return lamp.Level + lamp.Doubled + lamp.Bright + lamp.GetLevel()"), "19");
    // Lua reads the cache through a metatable of the object's own; scripts see the class's face.
    EXPECT_EQ(RunCached("return tostring(debug.getmetatable(lamp) ~= debug.getmetatable(Lamp()))"), "true");
    EXPECT_EQ(RunCached("return tostring(getmetatable(lamp) == getmetatable(Lamp()))"), "true");
    EXPECT_EQ(RunCached("local other = Lamp() return tostring(lamp == other) .. tostring(other == lamp)"), "truetrue");
    EXPECT_EQ(RunCached("return level(lamp)"), "1");
    EXPECT_EQ(RunCached("local take = lamp.Take return tostring(take == lamp.Take and lamp.Power == lamp.Power)"), "true");
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();

    struct Case {
        const char* code;
        const char* report;
    };
    const Case cases[] = {
        {"return lamp.Nothing", "MetaOperatorIndex: error - unknown symbol Nothing.\n"},
        {"lamp.Nothing = 1", "MetaOperatorIndex: error - unknown symbol Nothing.\n"},
        {"return lamp[1]", "MetaOperatorIndex: panic - currently supports only string indexes.\n"},
        {"getmetatable(lamp).__index(lamp, 'Take') return lamp.Nothing", "MetaOperatorIndex: error - unknown symbol Nothing.\n"},
        {"getmetatable(lamp).__gc(lamp) return lamp.Level",
         "MetaOperatorIndex: error - the object of Lamp is null or was collected.\n"},
        {"getmetatable(lamp).__gc(lamp) return lamp.GetLevel()",
         "GenericClass::LuaMethodCallProxieFunction: error - the object of Lamp is null or was collected.\n"},
    };
    for (const Case& c : cases) {
        host.Reports.clear();
        EXPECT_EQ(RunCached(c.code), "nil") << c.code;
        EXPECT_EQ(host.LastReport(), c.report) << c.code;
    }
    // Objects with a metatable of their own are still deleted when collected.
    host.Run("lamp = nil collectgarbage() collectgarbage()");
    EXPECT_EQ(Lamp::Alive, 0);
}

TEST_F(Caches, BaseMethodsRunOnTheBasePartOfADerivedObject)
{
    EXPECT_EQ(host.Run("local t = TaggedLamp() t.Level = 2 local mark = t.GetMark "
                       "return mark() .. t.GetMark() .. t.GetLevel()"),
              "552");
    // The method reaches the same part of the object as the member.
    EXPECT_EQ(host.Run("local l = Leaf() l.RootValue = 4 return l.GetRootValue() .. l.RootValue"), "44");
}

TEST_F(Caches, ChosenOverloadsFollowTheTypesOfTheValuesAndTheObjectsConst)
{
    EXPECT_EQ(host.Run("local l = Lamp() local t = {} "
                       "for k, v in ipairs({1, 'x', true, 2, false, 'y'}) do t[k] = l.Take(v) end "
                       "return table.concat(t, ',') .. ',' .. l.Take(nil) .. ',' .. l.Take(1, 2)"),
              "int,text,bool,int,bool,text,text,two");
    EXPECT_EQ(host.Run("local l, c = Lamp(), __const(Lamp()) return l.Power() .. c.Power() .. l.Power()"), "10110");
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();

    EXPECT_EQ(host.Run("local l = Lamp() l.Take(1) return l.Take({})"), "nil");
    EXPECT_EQ(host.LastReport(), "Can't match method to call 'Lamp.Take', candidates are:\n"
                                 "Take(int)\nTake(const char*)\nTake(bool)\nTake(int, int)\n"
                                 "Parameters are:\n* table\nCaused by: no one can be used.\n");
    EXPECT_EQ(host.Run("local l = __const(Lamp()) return l.Take(1)"), "nil");
    EXPECT_EQ(host.LastReport().rfind("Can't match method to call 'Lamp.Take const', candidates are:\n", 0), 0u);
}

TEST_F(Caches, AOneOverloadCallWithWrongValuesIsReported)
{
    const char* const calls[] = {"lamp.GetLevel(1)", "level()", "level(1)"};
    const char* const reports[] = {
        "Can't match method to call 'Lamp.GetLevel', candidates are:\nGetLevel() const\n"
        "Parameters are:\n* number\nCaused by: no one can be used.\n",
        "Can't match function to call level, candidates are:\nlevel(const Lamp&)\n"
        "Parameters are:\nNone\nCaused by: no one can be used.\n",
        "Can't match function to call level, candidates are:\nlevel(const Lamp&)\n"
        "Parameters are:\n* number\nCaused by: no one can be used.\n",
    };
    for (int k = 0; k < 3; ++k) {
        host.Reports.clear();
        EXPECT_EQ(RunCached(std::string("return ") + calls[k]), "nil") << calls[k];
        EXPECT_EQ(host.LastReport(), reports[k]) << calls[k];
    }
    host.Run("lamp = nil collectgarbage() collectgarbage()");
}

TEST_F(Caches, BindingAgainRefreshesWhatNamesStandFor)
{
    // A method value, an object's cache and a fresh object all follow the new base.
    EXPECT_EQ(host.Run("tagged = TaggedLamp() mark = tagged.GetMark return mark()"), "5");
    host.Declare([] { return Namespace().AddClass(Class<Tag>("Tag").Method("GetMark", [](const Tag&) { return 8; })); });
    EXPECT_EQ(host.Run("return mark() .. tagged.GetMark() .. TaggedLamp().GetMark()"), "888");

    // A name that is gone is reported by the method value that still holds it.
    host.Declare([] { return Namespace().AddClass(Class<Tag>("Tag")); });
    EXPECT_EQ(host.Run("return mark()"), "nil");
    EXPECT_EQ(host.LastReport(), "GenericClass::LuaMethodCallProxieFunction: panic - can't find GenericMethod GetMark!\n");
    EXPECT_EQ(host.Run("return TaggedLamp().GetMark"), "nil");
    EXPECT_EQ(host.LastReport(), "MetaOperatorIndex: error - unknown symbol GetMark.\n");
    host.Run("tagged = nil mark = nil collectgarbage() collectgarbage()");
}

} // namespace
