// Classes as scripts see them: members and properties, enumerators and constants, base
// classes, casts and up-cast paths, operators, and objects held by intrusive pointers.
#include "lua/LuaTestHost.h"

#include "lua/mluabind/StdBinding.h"
#include "lua/mluabind/impl/Declarations.h"
#include "misc/ptr.h"
#include "support/TestSupport.h"

using namespace mluabind;
using oxtest::LuaTestHost;

namespace {

struct Point {
    float X = 0, Y = 0;
};

struct Sprite {
    enum Mode { ModeA = 1, ModeB = 2 };
    Point Pos;
    int Layer = 0;
    const int Fixed = 3;
    Mode Current = ModeA;
    int Alpha = 255;
    int GetAlpha() const { return Alpha; }
    void SetAlpha(int alpha) { Alpha = alpha; }
    int GetKind() const { return 9; }
    void SetMode(Mode mode) { Current = mode; }
    Mode GetMode() const { return Current; }
};

struct Widget {
    static constexpr int FlagHidden = 1;
    virtual ~Widget() = default;
    int Id = 10;
    virtual const char* Name() const { return "widget"; }
    int Scale(int v) const { return v * 2; }
    int Scale(int v, int w) const { return v * w; }
};
struct Button : Widget {
    const char* Name() const override { return "button"; }
    const char* Scale(const char*) const { return "hidden"; } // hides every base Scale
    const char* Click() const { return "clicked"; }
};

// Two routes to Root: over Mid2 and Mid1, or over Other.
struct Root {
    int RootValue = 0;
};
struct Mid1 : Root {};
struct Mid2 : Mid1 {};
struct Other : Root {};
struct Leaf : Mid2, Other {};

struct Hidden {
    int Value() const { return 42; }
};
Hidden g_Hidden;

struct Vec {
    float X = 0, Y = 0;
    Vec() = default;
    Vec(float x, float y) : X(x), Y(y) {}
    Vec operator-() const { return {-X, -Y}; }
    Vec operator+(const Vec& o) const { return {X + o.X, Y + o.Y}; }
    bool operator==(const Vec& o) const { return X == o.X && Y == o.Y; }
};

struct Node : ox::misc::CRefCountedObj {
    static inline int Alive = 0;
    int Value = 0;
    Node() { ++Alive; }
    ~Node() override { --Alive; }
    int GetValue() const { return Value; }
    void SetValue(int value) { Value = value; }
};
using NodePtr = boost::intrusive_ptr<Node>;
NodePtr g_Held;

class Classes : public ::testing::Test {
protected:
    void SetUp() override
    {
        host.Declare([] {
            Namespace game("game");
            game.AddClass(Class<Point>("Point").Constructor<>().Member("X", &Point::X).Member("Y", &Point::Y));
            game.AddClass(Class<Sprite>("Sprite")
                              .Constructor<>()
                              .Member("Pos", &Sprite::Pos)
                              .Member("Layer", &Sprite::Layer)
                              .Member("Fixed", &Sprite::Fixed)
                              .Property("Alpha", &Sprite::GetAlpha, &Sprite::SetAlpha)
                              .Property("Kind", &Sprite::GetKind)
                              .Method("SetMode", &Sprite::SetMode)
                              .Method("GetMode", &Sprite::GetMode)
                              .Constant("ModeA", Sprite::ModeA)
                              .Constant("ModeB", Sprite::ModeB));
            game.AddClass(Class<Widget>("Widget")
                              .Constructor<>()
                              .Member("Id", &Widget::Id)
                              .Method("Name", &Widget::Name)
                              .Method("Scale", static_cast<int (Widget::*)(int) const>(&Widget::Scale))
                              .Method("Scale", static_cast<int (Widget::*)(int, int) const>(&Widget::Scale))
                              .Constant("FlagHidden", Widget::FlagHidden));
            game.AddClass(Class<Button>("Button")
                              .BaseClass<Widget>()
                              .Constructor<>()
                              .Method("Scale", static_cast<const char* (Button::*)(const char*) const>(&Button::Scale))
                              .Method("Click", &Button::Click));
            game.AddClass(Class<Root>("Root").Constructor<>().Member("RootValue", &Root::RootValue));
            game.AddClass(Class<Mid1>("Mid1").BaseClass<Root>());
            game.AddClass(Class<Mid2>("Mid2").BaseClass<Mid1>());
            game.AddClass(Class<Other>("Other").BaseClass<Root>());
            game.AddClass(Class<Leaf>("Leaf").BaseClass<Mid2>().BaseClass<Other>().Constructor<>());
            game.AddClass(Class<Hidden>("").Method("Value", &Hidden::Value));
            game.AddClass(Class<Vec>("Vec")
                              .Constructor<float, float>()
                              .Member("X", &Vec::X)
                              .Operator(OpUnm, &Vec::operator-)
                              .Operator(OpAdd, &Vec::operator+)
                              .Operator(OpEq, &Vec::operator==)
                              .Operator(OpToString, [](const Vec& v) { return v.X + v.Y; }));
            game.AddClass(Class<Node>("Node").Constructor<>().Method("GetValue", &Node::GetValue).Method("SetValue", &Node::SetValue));
            game.AddClass(IntrusivePtrClass<Node>("NodePtrT"));
            game.AddFunction(Function("GetHidden", [] { return &g_Hidden; }));
            game.AddFunction(Function("AsWidget", [](Widget* w) { return w; }));
            game.AddFunction(Function("Hold", [](const NodePtr& p) { g_Held = p; }));
            game.AddFunction(Function("MakeNode", [](int value) {
                NodePtr p(new Node);
                p->Value = value;
                return p;
            }));
            game.AddFunction(Function("HeldCount", [] { return g_Held ? static_cast<int>(g_Held->GetRefCount()) : 0; }));
            game.AddConstant(Constant("Version", 3));
            return game;
        });
    }
    void TearDown() override { g_Held.reset(); }

    LuaTestHost host;
};

TEST_F(Classes, MembersAreReferencesAndPropertiesCallAccessors)
{
    EXPECT_EQ(host.Run("s = game.Sprite() s.Pos.X = 5 s.Layer = 2 s.Alpha = 7 return s.Pos.X + s.Layer + s.Alpha + s.Kind"),
              "23");
    EXPECT_EQ(host.Run("return __get_typeex(s.Pos) .. ',' .. __get_typeex(__const(s).Pos)"), "game.Point,game.Point const");
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();

    struct Case {
        const char* code;
        const char* report;
    };
    const Case cases[] = {
        {"local s = game.Sprite() s.Fixed = 1", "MemberClass::PerformNewIndexOperator: can't assign to a const variable.\n"},
        {"local s = game.Sprite() s.Layer = {}", "MemberClass::PerformNewIndexOperator: can't convert a variable to assign.\n"},
        {"local s = game.Sprite() s.Kind = 1", "FreePropertyClass::PerformNewIndexOperator: can't assign - no setter available.\n"},
        {"local s = game.Sprite() s.Alpha = 'x'",
         "FreePropertyClass::PerformNewIndexOperator: can't convert params to call setter.\nParameters are:\n* string\n"},
        {"local s = __const(game.Sprite()) s.Pos.X = 1",
         "MetaOperatorNewIndex: can't assign a value to a member 'X' of a const object.\n"},
        {"local s = game.Sprite() s.Nothing = 1", "MetaOperatorIndex: error - unknown symbol Nothing.\n"},
        {"local s = game.Sprite() return s.Nothing", "MetaOperatorIndex: error - unknown symbol Nothing.\n"},
        {"local s = game.Sprite() return s[1]", "MetaOperatorIndex: panic - currently supports only string indexes.\n"},
        {"local s = game.Sprite() s[1] = 2", "MetaOperatorNewIndex: panic - currently supports only string indexes.\n"},
    };
    for (const Case& c : cases) {
        host.Reports.clear();
        host.Run(c.code);
        EXPECT_EQ(host.LastReport(), c.report) << c.code;
    }
    EXPECT_EQ(host.Run("local s = game.Sprite() return s.Fixed + s.Pos.X"), "3");
}

TEST_F(Classes, EnumeratorsAndConstants)
{
    EXPECT_EQ(host.Run("return game.Sprite.ModeB"), "2");
    EXPECT_EQ(host.Run("local s = game.Sprite() s.SetMode(game.Sprite.ModeB) return s.GetMode() + s.ModeA"), "3");
    EXPECT_EQ(host.Run("return game.Version"), "3");
    // Constants of a base show through the derived class's table.
    EXPECT_EQ(host.Run("return game.Button.FlagHidden"), "1");
    EXPECT_EQ(host.Run("return game.Button.__MLUABIND_LUANAMESPACEDESCRIPTIONTAG"), "game.Button");
    // Scripts see a read-only face of a class's metatable, in the storage and by getmetatable.
    EXPECT_EQ(host.Run("local face = getmetatable(game.Vec(1, 2)) "
                       "return face == __MLUABIND_LUAOPERATORCLOSURESSTORAGE['game.Vec'] and "
                       "getmetatable(face) == false and type(face.__add) == 'function'"),
              "true");
    EXPECT_EQ(host.Run("getmetatable(game.Vec(1, 2)).__add = nil return tostring(game.Vec(1, 2) + game.Vec(3, 4))"),
              "10");
    EXPECT_EQ(host.LastReport(),
              "MetaOperatorNewIndex: error - the metatable of game.Vec is read-only ('__add' can't be set).\n");
}

TEST_F(Classes, BaseClassMethodsAndHiding)
{
    EXPECT_EQ(host.Run("local b = game.Button() return b.Name() .. b.Click() .. b.Id"), "buttonclicked10");
    // Button.Scale hides both Widget.Scale overloads.
    EXPECT_EQ(host.Run("local b = game.Button() return b.Scale('x')"), "hidden");
    EXPECT_EQ(host.Run("local b = game.Button() return b.Scale(3)"), "nil");
    EXPECT_EQ(host.LastReport(), "Can't match method to call 'game.Button.Scale', candidates are:\n"
                                 "Scale(const char*) const\nParameters are:\n* number\nCaused by: no one can be used.\n");
    EXPECT_EQ(host.Run("local w = game.Widget() return w.Scale(3) + w.Scale(3, 4)"), "18");
    // A base method through a derived object finds the base part of it.
    EXPECT_EQ(host.Run("local l = game.Leaf() l.RootValue = 4 return l.RootValue"), "4");
}

TEST_F(Classes, CastsAndTypeNames)
{
    EXPECT_EQ(host.Run("local w = game.AsWidget(game.Button()) return __get_typeex(w) .. ' ' .. w.Name()"),
              "game.Widget button");
    EXPECT_EQ(host.Run("b = game.Button() local w = __cast(b, 'game.Widget') return __get_typeex(w) .. ' ' .. __get_typeex(b)"),
              "game.Widget game.Button owned");
    EXPECT_EQ(host.Run("local w = game.AsWidget(b) return __cast(w, game.Button).Click()"), "clicked");
    EXPECT_EQ(host.Run("return tostring(__cast(game.Widget(), game.Button))"), "nil"); // dynamic down-cast fails
    EXPECT_EQ(host.Run("return __get_typeex(__const(game.Button()))"), "game.Button const owned");
    EXPECT_EQ(host.Run("return __get_type() .. ',' .. __get_type(1) .. ',' .. __get_type(io.stdout)"), "no value,number,userdata");
    EXPECT_EQ(host.Run("return __get_rtti_type(game.Vec(1, 2))"), "(anonymous namespace)::Vec");
    EXPECT_EQ(host.Run("return __get_type(__cast_unsafe(game.Button(), 'game.Widget'))"), "game.Widget");
    EXPECT_EQ(host.Run("local r = __cast(1) return 'on'"), "on");
    EXPECT_EQ(host.LastReport(), "LuaCast: missings parameters");
    host.Run("__cast(b, 5)");
    EXPECT_EQ(host.LastReport(), "LuaCast: can't retreive target type name");
    host.Run("__cast(b, 'game.Nothing')");
    EXPECT_EQ(host.LastReport(), "LuaCast: can't target generic class for game.Nothing");

    // The shorter of two routes to a base is kept.
    i::GenericClass* leaf = host.FindClass(typeid(Leaf));
    ASSERT_NE(leaf, nullptr);
    const std::vector<i::GenericClass*>& path = leaf->m_UpcastPaths.at(std::type_index(typeid(Root)));
    ASSERT_EQ(path.size(), 2u);
    EXPECT_EQ(path[0]->FullName, "game.Other");
    Leaf object;
    static_cast<Other&>(object).RootValue = 8;
    EXPECT_EQ(leaf->Upcast(host, typeid(Root), &object), static_cast<Root*>(static_cast<Other*>(&object)));

    // A class without a name has no table, yet its objects reach scripts.
    EXPECT_EQ(host.Run("return game.GetHidden().Value()"), "42");
    // No constructor: the table can't be called.
    EXPECT_EQ(host.Run("return tostring(pcall(game.Mid1))"), "false");
}

TEST_F(Classes, Operators)
{
    EXPECT_EQ(host.Run("local v = -game.Vec(1, 2) return v.X"), "-1");
    EXPECT_EQ(host.Run("local v = game.Vec(1, 2) + game.Vec(3, 4) return tostring(v)"), "10");
    EXPECT_EQ(host.Run("return tostring(game.Vec(1, 2) == game.Vec(1, 2)) .. tostring(game.Vec(1, 2) == game.Vec(2, 2))"),
              "truefalse");
    // The object must be the first operand of its operator.
    EXPECT_EQ(host.Run("local v = game.Vec(1, 2) + 1 return tostring(v)"), "nil");
    EXPECT_EQ(host.LastReport(), "Can't match method to call 'game.Vec.__add', candidates are:\n"
                                 "__add(const game.Vec&) const\nParameters are:\n* custom class: game.Vec\n* number\n"
                                 "Caused by: no one can be used.\n");
}

TEST_F(Classes, IntrusivePointersCountEveryHolder)
{
    lua_State* L = host.GetLuaState();
    // The pointer object takes over what Lua owned.
    EXPECT_EQ(host.Run("n = game.Node() n.SetValue(3) game.Hold(game.NodePtrT(n)) return __get_typeex(n)"), "game.Node");
    lua_gc(L, LUA_GCCOLLECT, 0);
    EXPECT_EQ(g_Held->GetRefCount(), 1);
    EXPECT_EQ(host.Run("local p = game.MakeNode(5) held = game.NodePtrT(n) return p.GetValue() + held.GetValue() + game.HeldCount()"),
              "10");
    lua_gc(L, LUA_GCCOLLECT, 0);
    EXPECT_EQ(g_Held->GetRefCount(), 2); // `held` still holds it
    EXPECT_EQ(Node::Alive, 1);           // MakeNode's node went with its pointer
    host.Run("held = nil n = nil");
    lua_gc(L, LUA_GCCOLLECT, 0);
    EXPECT_EQ(g_Held->GetRefCount(), 1);
    g_Held.reset();
    EXPECT_EQ(Node::Alive, 0);

    // A pointer isn't made implicitly: its constructor moves ownership.
    EXPECT_EQ(host.Run("game.Hold(game.Node()) return 'on'"), "on");
    EXPECT_EQ(host.LastReport(), "Can't match function to call game.Hold, candidates are:\n"
                                 "game.Hold(const game.NodePtrT&)\nParameters are:\n* custom class: game.Node\n"
                                 "Caused by: no one can be used.\n");
    EXPECT_EQ(host.Run("return game.NodePtrT().GetValue()"), "nil");
    EXPECT_EQ(host.LastReport(), "GenericClass::LuaMethodCallProxieFunction: error - the object of game.Node is null or was collected.\n");
    // A method value of a pointer follows the object it points at now.
    EXPECT_EQ(host.Run("local a, b = game.MakeNode(1), game.MakeNode(2) local get = a.GetValue a.swap(b) return get()"), "2");
}

TEST_F(Classes, BindingAgainReplacesAndValuesConvertForNativeCallers)
{
    // A second binding of the same vocabulary replaces classes and same-signature overloads.
    host.Declare([] {
        return Namespace("game")
            .AddClass(Class<Widget>("Widget").Constructor<>().Method("Name", [](const Widget&) { return "again"; }))
            .AddFunction(Function("AsWidget", [](Widget* w) { return w; }));
    });
    EXPECT_EQ(host.Run("return game.AsWidget(game.Widget()).Name()"), "again");
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();

    lua_State* L = host.GetLuaState();
    ASSERT_EQ(PushValue(host, L, Vec(1, 2)), 1);
    Vec copy;
    EXPECT_LT(MatchValue<Vec>(host, L, -1), i::NoMatch);
    EXPECT_TRUE(ExtractValue(host, L, -1, copy));
    EXPECT_EQ(copy.Y, 2);
    EXPECT_EQ(host.Run("return 'x'"), "x"); // the stack is left to its owner
    lua_pushboolean(L, 1);
    int number = 0;
    EXPECT_EQ(MatchValue<int>(host, L, -1), 2);
    EXPECT_TRUE(ExtractValue(host, L, -1, number));
    EXPECT_EQ(number, 1);
    EXPECT_EQ(MatchValue<Vec>(host, L, -1), i::NoMatch);
    lua_settop(L, 0);
    EXPECT_EQ(PushValue(host, L, static_cast<Hidden*>(nullptr)), 1);
    EXPECT_TRUE(lua_isnil(L, -1));
    lua_settop(L, 0);
}

TEST(RefCounted, CountsAndDeletesAtZero)
{
    Node* node = new Node;
    EXPECT_EQ(node->GetRefCount(), 0);
    {
        NodePtr a(node);
        NodePtr b = a;
        EXPECT_EQ(node->GetRefCount(), 2);
    }
    EXPECT_EQ(Node::Alive, 0);
    Node full;
    for (int k = 0; k < 255; ++k)
        full.AddRef();
    EXPECT_CONTRACT_FAILURE(full.AddRef(), "m_RefCount < 255");
}

} // namespace
