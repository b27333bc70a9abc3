// Overload selection by score, failure reports, const rules, implicit temporaries, and
// calls from coroutines and on objects that are gone or foreign.
#include "lua/LuaTestHost.h"

#include "support/TestSupport.h"

#include <memory>
#include <vector>

#include <string>

using namespace mluabind;
using oxtest::LuaTestHost;
using oxtest::RaisingHost;

namespace {

std::string g_Last;

struct Base {
    virtual ~Base() = default;
    virtual const char* Name() const { return "base"; }
};
struct Derived : Base {
    const char* Name() const override { return "derived"; }
};

// Built implicitly from a Lua string; counts what lives.
struct Text {
    static inline int Alive = 0;
    static inline int Built = 0;
    std::string Value;
    Text(const char* value) : Value(value ? value : "") { ++Alive, ++Built; }
    Text(const Text& other) : Value(other.Value) { ++Alive, ++Built; }
    ~Text() { --Alive; }
};

// Has a one-parameter constructor with a policy: never used implicitly.
struct Adopted {
    explicit Adopted(int) {}
    Adopted(const char*) {}
};

struct Unregistered {};

struct Gauge {
    int Value = 0;
    int Get() const { return Value; }
    int Get() { return Value + 100; }
    void Set(int value) { Value = value; }
    int Many(int) { return 0; }
};

Namespace Overloads()
{
    Namespace ns;
    ns.AddFunction(Function("amb", [](int) { g_Last = "int"; }))
        .AddFunction(Function("amb", [](float) { g_Last = "float"; }))
        .AddFunction(Function("pick", [](bool) { g_Last = "bool"; }))
        .AddFunction(Function("pick", [](int) { g_Last = "int"; }))
        .AddFunction(Function("which", [](Base&, int) { g_Last = "Base&"; }))
        .AddFunction(Function("which", [](Derived&, int) { g_Last = "Derived&"; }))
        .AddFunction(Function("wide", [](const char16_t* text, float f) {
            g_Last = std::to_string(std::u16string(text).size()) + " " + std::to_string(f);
        }))
        .AddFunction(Function("length", [](const Text& text) {
            g_Last = "alive " + std::to_string(Text::Alive);
            return static_cast<int>(text.Value.size());
        }))
        .AddFunction(Function("unbound", [](const Text&) {
            g_Last = "alive " + std::to_string(Text::Alive);
            return Unregistered{};
        }))
        .AddFunction(Function("adopted", [](const Adopted&) { g_Last = "adopted"; }))
        .AddFunction(Function("isnull", [](Base* base) { return base == nullptr; }))
        .AddFunction(Function("byref", [](const Base& base) { return base.Name(); }));
    ns.AddClass(Class<Base>("Base").Constructor<>().Method("Name", &Base::Name));
    ns.AddClass(Class<Derived>("Derived").BaseClass<Base>().Constructor<>());
    ns.AddClass(Class<Text>("Text").Constructor<const char*>().Constructor<const Text&>());
    ns.AddClass(Class<Adopted>("Adopted").Constructor<const char*>(Adopt(1)).Constructor<int>());
    auto& gauge = Class<Gauge>("Gauge")
                      .Constructor<>()
                      .Method("Get", static_cast<int (Gauge::*)() const>(&Gauge::Get))
                      .Method("Get", static_cast<int (Gauge::*)()>(&Gauge::Get))
                      .Method("Set", &Gauge::Set)
                      .Method("ConstOnly", [](const Gauge& g) { return g.Value; });
    for (int k = 0; k < 60; ++k)
        gauge.Method("Many", &Gauge::Many);
    ns.AddClass(gauge);
    return ns;
}

class Dispatch : public ::testing::Test {
protected:
    void SetUp() override
    {
        g_Last.clear();
        host.Declare(Overloads);
    }
    LuaTestHost host;
};

TEST_F(Dispatch, LowestScoreWinsAndTiesAreReported)
{
    EXPECT_EQ(host.Run("amb(1)"), "nil");
    EXPECT_EQ(host.LastReport(), "Can't match function to call amb, candidates are:\n"
                                 "amb(int)\namb(float)\n"
                                 "Parameters are:\n* number\n"
                                 "Caused by: ambiguity.\n");
    EXPECT_EQ(g_Last, "");

    host.Run("pick(true)");
    EXPECT_EQ(g_Last, "bool"); // 1 against 2
    host.Run("pick(3)");
    EXPECT_EQ(g_Last, "int");
    host.Run("which(Derived(), 1)");
    EXPECT_EQ(g_Last, "Derived&"); // exact class 1, base class 2
    host.Run("which(Base(), 1)");
    EXPECT_EQ(g_Last, "Base&");
    host.Run("wide('xy', 1.5)");
    EXPECT_EQ(g_Last, "2 1.500000");
    EXPECT_EQ(host.Reports.size(), 1u);
}

TEST_F(Dispatch, NoCandidateReportListsEveryOverloadAndArgument)
{
    EXPECT_EQ(host.Run("local r = pick(1, 'a', nil, {}, Derived(), io.stdout) return tostring(r)"), "nil");
    EXPECT_EQ(host.LastReport(), "Can't match function to call pick, candidates are:\n"
                                 "pick(bool)\npick(int)\n"
                                 "Parameters are:\n* number\n* string\n* lua type: nil\n* table\n"
                                 "* custom class: Derived\n* unknown\n"
                                 "Caused by: no one can be used.\n");
    host.Run("pick()");
    EXPECT_NE(host.LastReport().find("Parameters are:\nNone\nCaused by: no one can be used.\n"), std::string::npos);

    // Only the first 49 of 60 failed overloads are listed.
    host.Run("local g = Gauge() g.Many('x')");
    const std::string& report = host.LastReport();
    EXPECT_EQ(report.rfind("Can't match method to call 'Gauge.Many', candidates are:\nMany(int)\n", 0), 0u);
    size_t lines = 0;
    for (size_t at = report.find("Many(int)\n"); at != std::string::npos; at = report.find("Many(int)\n", at + 1))
        ++lines;
    EXPECT_EQ(lines, 49u);
}

TEST_F(Dispatch, ConstObjectsOnlyTakeConstMethods)
{
    EXPECT_EQ(host.Run("local g = Gauge() g.Set(5) return g.Get()"), "105"); // non-const wins on a mutable object
    EXPECT_EQ(host.Run("local g = Gauge() g.Set(5) return __const(g).Get()"), "5");
    EXPECT_EQ(host.Run("local g = Gauge() return g.ConstOnly()"), "0"); // factor 2, still the only one
    EXPECT_EQ(host.Run("local g = __const(Gauge()) g.Set(1) return 'went on'"), "went on");
    EXPECT_EQ(host.LastReport(), "Can't match method to call 'Gauge.Set const', candidates are:\n"
                                 "Set(int)\nParameters are:\n* number\nCaused by: no one can be used.\n");
    // A T& parameter refuses a const object.
    host.Run("which(__const(Derived()), 1)");
    EXPECT_EQ(g_Last, "");
    EXPECT_NE(host.LastReport().find("* custom class: const Derived\n"), std::string::npos);
    EXPECT_NE(host.LastReport().find("which(Base&, int)\nwhich(Derived&, int)\n"), std::string::npos);
}

TEST_F(Dispatch, ImplicitTemporariesLiveForTheCallOnly)
{
    EXPECT_EQ(host.Run("return length('four')"), "4");
    EXPECT_EQ(g_Last, "alive 1");
    EXPECT_EQ(Text::Alive, 0);
    // A constructor with a policy is never used implicitly; the other one doesn't fit.
    g_Last.clear();
    host.Run("adopted('x')");
    EXPECT_EQ(g_Last, "");
    EXPECT_NE(host.LastReport().find("adopted(const Adopted&)\n"), std::string::npos);
    // nil is a null pointer for T*, and nothing for const T& without a constructor from nil.
    EXPECT_EQ(host.Run("return isnull(nil)"), "true");
    EXPECT_EQ(host.Run("return byref(nil)"), "nil");
    EXPECT_NE(host.LastReport().find("byref(const Base&)\nParameters are:\n* lua type: nil\n"), std::string::npos);
    // The temporary made from nil (a null text) goes through the constructor.
    EXPECT_EQ(host.Run("return length(nil)"), "0");
    EXPECT_EQ(Text::Alive, 0);
}

TEST_F(Dispatch, MethodCallsUseTheDotAndKeepTheirObject)
{
    // obj:Method passes the object as one more argument.
    EXPECT_EQ(host.Run("local g = Gauge() return g:Get()"), "nil");
    EXPECT_NE(host.LastReport().find("Parameters are:\n* custom class: Gauge\n"), std::string::npos);
    // A method value outlives the last other reference to its object.
    EXPECT_EQ(host.Run("local g = Gauge() g.Set(7) local get = g.Get g = nil collectgarbage() collectgarbage() return get()"),
              "107");
    EXPECT_EQ(host.Run("local g = Gauge() return tostring(g.Get == g.Get)"), "true");
}

TEST_F(Dispatch, CoroutinesCallThroughTheirOwnState)
{
    std::string code = "local co = coroutine.create(function(g)"
                       "  local sum = 0"
                       "  for k = 1, 3 do g.Set(k) sum = sum + g.Get() coroutine.yield(sum) end"
                       "  local bad = g.Set('x')"
                       "  return 'after ' .. tostring(bad)"
                       "end)"
                       "local g = Gauge() local out = {}"
                       "while coroutine.status(co) ~= 'dead' do"
                       "  local ok, value = coroutine.resume(co, g) out[#out + 1] = tostring(ok) .. ':' .. tostring(value)"
                       "end return table.concat(out, ',')";
    EXPECT_EQ(host.Run(code), "true:101,true:203,true:306,true:after nil");
    EXPECT_EQ(host.LastReport(), "Can't match method to call 'Gauge.Set', candidates are:\n"
                                 "Set(int)\nParameters are:\n* string\nCaused by: no one can be used.\n");
}

TEST_F(Dispatch, ObjectsThatAreGoneOrForeignAreReported)
{
    EXPECT_EQ(host.Run("local g = Gauge() getmetatable(g).__gc(g) return g.Get()"), "nil");
    EXPECT_EQ(host.LastReport(), "GenericClass::LuaMethodCallProxieFunction: error - the object of Gauge is null or was collected.\n");
    EXPECT_EQ(host.Run("local g = Gauge() local get = g.Get getmetatable(g).__gc(g) return get()"), "nil");
    EXPECT_EQ(host.Run("local g = Gauge() return getmetatable(g).__index(io.stdout, 'Get')"), "nil");
    EXPECT_EQ(host.LastReport(), "MetaOperatorIndex: error - the value is not an object of a bound class.\n");
    EXPECT_EQ(host.Run("getmetatable(Gauge()).__gc(io.stdout) return io.stdout ~= nil"), "true");
    // The host goes on.
    EXPECT_EQ(host.Run("local g = Gauge() g.Set(2) return __const(g).Get()"), "2");
}

TEST(DispatchRaising, DefaultReportRaisesALuaErrorAfterCleanUp)
{
    RaisingHost host;
    host.Declare(Overloads);
    EXPECT_EQ(host.Run("return select(2, pcall(amb, 1))"),
              "Can't match function to call amb, candidates are:\namb(int)\namb(float)\n"
              "Parameters are:\n* number\nCaused by: ambiguity.\n");
    // A temporary built for a call that fails late is released before the error unwinds.
    EXPECT_EQ(host.Run("return select(2, pcall(unbound, 'text'))").rfind("CreateCustomLuaVariable<ByVal> can't find GenericClass for ", 0), 0u);
    EXPECT_EQ(g_Last, "alive 1");
    EXPECT_EQ(Text::Alive, 0);

    // Inside a coroutine the error ends the coroutine, not the caller.
    EXPECT_EQ(host.Run("local co = coroutine.create(function() local g = Gauge() g.Set(1) g.Set('x') end)"
                       "local ok, message = coroutine.resume(co)"
                       "return tostring(ok) .. ' ' .. coroutine.status(co) .. ' ' .. message"),
              "false dead Can't match method to call 'Gauge.Set', candidates are:\n"
              "Set(int)\nParameters are:\n* string\nCaused by: no one can be used.\n");
    EXPECT_EQ(host.Run("return length('abc')"), "3");
}

TEST(DispatchRaising, NativeExceptionsBecomeReports)
{
    RaisingHost host;
    host.Declare([] {
        return Namespace().AddFunction(Function("throws", [](int n) -> int {
            if (n > 0)
                throw std::runtime_error("too big");
            return n;
        }));
    });
    EXPECT_EQ(host.Run("return select(2, pcall(throws, 1))"),
              "mluabind: error - native exception in a bound call: too big\n");
    EXPECT_EQ(host.Run("return throws(0)"), "0");
}

// Ownership moves with the adopt policies.
struct Pool {
    std::vector<std::unique_ptr<Base>> Items;
    void Take(Base* base) { Items.emplace_back(base); }
};

// Built implicitly from a Text only: conversions must not chain through Text.
struct Label {
    std::string Value;
    Label(const Text& text) : Value(text.Value) {}
};

TEST(DispatchPolicies, AdoptMovesOwnershipAndConversionsDontChain)
{
    LuaTestHost host;
    static Pool pool;
    host.Declare([] {
        return Namespace()
            .AddClass(Class<Base>("Base").Constructor<>().Method("Name", &Base::Name).Method(
                "GiveToPool", [](Base& base) { pool.Take(&base); }, Adopt(0)))
            .AddClass(Class<Derived>("Derived").BaseClass<Base>().Constructor<>())
            .AddClass(Class<Pool>("Pool").Method("Take", &Pool::Take, Adopt(1)))
            .AddClass(Class<Text>("Text").Constructor<const char*>())
            .AddClass(Class<Label>("Label").Constructor<const Text&>())
            .AddFunction(Function("pool", [] { return &pool; }))
            .AddFunction(Function("make", [] { return static_cast<Base*>(new Derived); }, Adopt(-1)))
            .AddFunction(Function("label", [](const Label& label) { return label.Value.c_str(); }));
    });
    EXPECT_EQ(host.Run("b = Derived() pool().Take(b) return __get_typeex(b)"), "Derived");
    EXPECT_EQ(host.Run("local m = make() return __get_typeex(m) .. ' ' .. m.Name()"), "Base owned derived");
    EXPECT_EQ(host.Run("local f = Base() f.GiveToPool() return __get_typeex(f)"), "Base");
    host.Run("b = nil collectgarbage()");
    ASSERT_EQ(pool.Items.size(), 2u);
    EXPECT_STREQ(pool.Items[0]->Name(), "derived"); // not deleted by Lua
    pool.Items.clear();

    EXPECT_EQ(host.Run("return label(Text('t'))"), "t");
    EXPECT_EQ(host.Run("return label('t')"), "nil");
    EXPECT_NE(host.LastReport().find("label(const Label&)\nParameters are:\n* string\nCaused by: no one can be used.\n"),
              std::string::npos);
}

TEST(DispatchPolicies, DeclarationModeAndHostStackContracts)
{
    LuaTestHost host;
    host.BeginBinding();
    EXPECT_EQ(CHost::GetCurrentHost(), &host);
    EXPECT_CONTRACT_FAILURE(host.BeginBinding(), "m_CurrentBindingHost == 0");
    host.EndBinding();
    EXPECT_CONTRACT_FAILURE(host.EndBinding(), "m_CurrentBindingHost == this");
    EXPECT_CONTRACT_FAILURE(CHost::PopCurrentHost(), "Top>-1");
    EXPECT_CONTRACT_FAILURE(CHost::GetCurrentHost(), "!Empty()");
    for (int k = 0; k < 32; ++k)
        CHost::PushCurrentHost(&host);
    EXPECT_CONTRACT_FAILURE(CHost::PushCurrentHost(&host), "Top>=-1 && Top<MaxSize-1");
    for (int k = 0; k < 32; ++k)
        CHost::PopCurrentHost();
}

} // namespace
