#include "core/Settings.h"
#include "core/SettingsReaders.h"
#include "support/TestSupport.h"

#include <boost/lexical_cast.hpp>
#include <boost/make_shared.hpp>

#include <algorithm>

using namespace ox::core;
using ox::graphics::Color;
using ox::misc::StringA88;

namespace {

bool Load(CSettings& settings, const std::string& xml, const std::string& name = "test.xml")
{
    return settings.LoadXmlFromMemory(xml.data(), xml.size(), name);
}

bool HasEntry(const oxtest::LogCapture& log, const std::string& entry)
{
    auto entries = log.Entries();
    return std::find(entries.begin(), entries.end(), entry) != entries.end();
}

} // namespace

TEST(Settings, NamedObjectMakesANamedChildOfTheElementAround)
{
    CSettings settings;
    ASSERT_TRUE(Load(settings, "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
                               "<scene id=\"s1\">\n"
                               "  <named_object name=\"hero\" ignored=\"1\"><sprite x=\"5\">\n"
                               "    <named_object name=\"weapon\"><sword/></named_object>\n"
                               "  </sprite></named_object>\n"
                               "  <plain/>\n"
                               "</scene>"));
    const CSettingsGroup& scene = settings.GetChild("scene");
    EXPECT_EQ(scene.GetValue("id"), "s1");
    EXPECT_EQ(scene.EnumChildren(""), 2u) << "the named_object itself makes no node";
    const CSettingsGroup* sprite = scene.GetChildRef("sprite");
    ASSERT_NE(sprite, nullptr);
    EXPECT_EQ(scene.GetNamedChildRef("hero"), sprite);
    EXPECT_EQ(sprite->GetParent(), &scene);
    EXPECT_EQ(sprite->GetValue("x"), "5");
    EXPECT_EQ(scene.GetNamedChildRef("weapon", false), nullptr);
    EXPECT_EQ(scene.GetNamedChildRef("weapon", true), sprite->GetChildRef("sword"))
        << "the recursive walk goes through named children";
    EXPECT_EQ(settings.GetNamedChildRef("hero", true), nullptr) << "the scene itself is not named";

    // At top level it is a broken contract: logged, dropped with its content, the load goes on.
    oxtest::LogCapture log;
    CSettings broken;
    EXPECT_TRUE(Load(broken, "<xml>\n<named_object name=\"x\"><lost/></named_object>\n<kept/></xml>", "bad.xml"));
    EXPECT_EQ(broken.EnumChildren(), 1u);
    EXPECT_EQ(broken.GetFirstChild().GetId(), "kept");
    EXPECT_TRUE(log.Contains("assertion failed \"_current_node != 0\""));
    EXPECT_TRUE(HasEntry(log, "core|3|CSettings::LoadXml bad.xml: \"named_object\" at line 2 has no element around it, dropped"));
}

TEST(Settings, LookupsMissChainAndWalkInOrder)
{
    CSettings settings;
    ASSERT_TRUE(Load(settings, "<xml><a><b><c id=\"deep\"/></b><c id=\"shallow\" k=\"v\"/></a>"
                               "<d/><e/><e/></xml>"));
    EXPECT_EQ(settings.EnumChildren(""), 4u);
    EXPECT_EQ(settings.EnumChildren("e"), 2u);
    EXPECT_EQ(settings.GetChild("nothing").GetChild("never").GetValue("x"), "");
    EXPECT_FALSE(settings.GetChild("a").IsValue("x"));
    EXPECT_EQ(settings.GetChildRef("never_seen_name_anywhere"), nullptr);

    const CSettingsGroup& a = settings.GetChild("a");
    EXPECT_EQ(a.GetChild("c").GetValue("id"), "shallow");
    EXPECT_EQ(a.GetChild("c", true).GetValue("id"), "deep") << "a subtree is searched before the next child";
    EXPECT_EQ(a.GetChildByAttribute("c", "k", "v", true).GetValue("id"), "shallow");
    EXPECT_EQ(a.GetChildByAttributeRef("c", "k", "w", true), nullptr);

    const CSettingsGroup& d = settings.GetChild("d");
    EXPECT_EQ(&d.GetNextSibling(), settings.GetChildRef("e"));
    EXPECT_EQ(settings.GetChild("e").GetNextSibling().GetNextSiblingRef(), nullptr);
    CSettingsGroup unnamed;
    auto child = boost::make_shared<CSettingsGroup>();
    CSettingsGroup* raw = child.get();
    unnamed.AddChild(child);
    unnamed.AddChild(boost::make_shared<CSettingsGroup>("x"));
    EXPECT_EQ(&raw->GetNextSibling(), &CSettingsGroup::Empty()) << "an empty id has no next sibling";
}

TEST(Settings, RemoveAndCopyKeepNamedChildrenConsistent)
{
    CSettings settings;
    ASSERT_TRUE(Load(settings, "<xml><s><named_object name=\"n1\"><o v=\"1\"><p/></o></named_object><q/></s></xml>"));
    CSettingsGroup& s = *settings.GetChildRef("s");

    CSettingsGroup copy;
    s.CopyTo(copy);
    EXPECT_EQ(copy.GetId(), "s");
    const CSettingsGroup* o = copy.GetNamedChildRef("n1");
    ASSERT_NE(o, nullptr);
    EXPECT_NE(o, s.GetNamedChildRef("n1")) << "a deep copy";
    EXPECT_EQ(o->GetValue("v"), "1");
    EXPECT_EQ(o->EnumChildren("p"), 1u);

    auto keep = boost::shared_ptr<CSettingsGroup>();
    for (const auto& c : s.GetChildren())
        if (c->GetId() == "o")
            keep = c;
    s.RemoveChild(*keep);
    EXPECT_EQ(s.GetNamedChildRef("n1"), nullptr);
    EXPECT_EQ(s.EnumChildren(), 1u);
    EXPECT_EQ(keep->GetParent(), nullptr);
    s.RemoveChild(*keep); // not a child any more: nothing happens
    EXPECT_EQ(s.EnumChildren(), 1u);
}

TEST(Settings, AttributesSortedFirstWrittenFoundFirst)
{
    CSettingsGroup group;
    group.AddValue("dup", "first");
    for (char c = 'a'; c <= 'z'; ++c)
        group.AddValue(std::string(1, c).c_str(), "x");
    group.AddValue("dup", "second");
    EXPECT_EQ(group.GetValue("dup"), "first");
    EXPECT_EQ(group.EnumAttributes(), 28u);
    EXPECT_EQ(group.GetAttribute(0), "a");
    EXPECT_EQ(group.GetAttribute(4), "dup");
    EXPECT_EQ(group.GetAttribute(5), "dup");
    EXPECT_EQ(group.GetAttribute(28), "") << "out of range: the empty identifier";

    CSettings settings;
    ASSERT_TRUE(Load(settings, "<xml><n z=\"1\" k=\"one\" a=\"2\" k=\"two\"/></xml>"));
    EXPECT_EQ(settings.GetChild("n").GetValue("k"), "one");
}

TEST(Settings, LoadingLogsAndAddsUp)
{
    oxtest::LogCapture log;
    CSettings settings;
    EXPECT_TRUE(Load(settings, "<xml><a/></xml>", "one.xml"));
    EXPECT_TRUE(Load(settings, "<xml><a/><b/></xml>", "two.xml"));
    EXPECT_EQ(settings.EnumChildren("a"), 2u);
    EXPECT_TRUE(HasEntry(log, "core|0|CSettings::LoadXml loading one.xml"));

    EXPECT_FALSE(Load(settings, "<html><a/></html>", "bad.xml"));
    EXPECT_TRUE(HasEntry(log, "core|3|CSettings::LoadXml failed on file bad.xml"));
    EXPECT_EQ(settings.EnumChildren(), 3u) << "a refused file leaves the tree unchanged";

    EXPECT_TRUE(Load(settings, "<xml>\n<c/>\n<d v=\"1", "cut.xml"));
    EXPECT_EQ(settings.EnumChildren("d"), 1u) << "nodes made before the break stay";
    EXPECT_TRUE(HasEntry(log, "core|2|CSettings::LoadXml cut.xml: an attribute value is not closed at line 3"));

    const std::string longName(100, 'n');
    EXPECT_TRUE(Load(settings, "<xml><" + longName + " " + longName + "=\"v\"/></xml>", "long.xml"));
    const CSettingsGroup& cut = settings.GetChild(longName.substr(0, 87));
    EXPECT_EQ(cut.GetValue(longName.substr(0, 87)), "v");
    EXPECT_TRUE(log.Contains("longer than 87 characters, cut"));
    EXPECT_TRUE(Load(settings, "<xml><s><named_object name=\"" + longName + "\">\n<o/></named_object></s></xml>", "named.xml"));
    EXPECT_NE(settings.GetChild("s").GetNamedChildRef(longName.substr(0, 87)), nullptr);
    EXPECT_TRUE(log.Contains("named.xml: name \"" + longName + "\" at line 2 is longer"));

    EXPECT_FALSE(Load(settings, "", "empty.xml"));
    EXPECT_TRUE(HasEntry(log, "core|3|CSettings::LoadXml failed on file empty.xml"));
}

TEST(Settings, LoadXmlDirectReadsFromTheWorkingFolder)
{
    oxtest::TempDir dir;
    dir.Write("props/x.xml", "<?xml version=\"1.0\"?><opt v=\"\xD0\x96\"/>");
    oxtest::ScopedCwd cwd(dir.Path());
    oxtest::LogCapture log;
    CSettings settings;
    EXPECT_TRUE(settings.LoadXmlDirect(u"props/x.xml"));
    EXPECT_EQ(ReadWString(settings.GetChild("opt"), "v"), u"\u0416");
    EXPECT_FALSE(settings.LoadXmlDirect(u"props/missing.xml"));
    const std::string missing = (dir.Path() / "props/missing.xml").string();
    EXPECT_TRUE(HasEntry(log, "core|3|CSettings::LoadXml failed on file " + missing));
    EXPECT_TRUE(HasEntry(log, "core|0|CSettings::LoadXml loading " + missing));
}

TEST(SettingsValues, PoolsAndCountersAcrossTheCollector)
{
    CSettingsRefCountedConstString::CollectGarbage();
    const uint32_t total0 = g_CharsAllocatedTotal;
    const uint32_t used0 = g_CharsUsedNow;
    ASSERT_EQ(total0, used0) << "after a collection every entry is in use";
    if (total0 > 1500)
        GTEST_SKIP() << "values held by other code leave too little room below the collection threshold";

    {
        CSettingsRefCountedConstString a("pool-test");
        CSettingsRefCountedConstString copy = a;
        EXPECT_EQ(a.GetRefCount(), 2);
        EXPECT_EQ(g_CharsAllocatedTotal, total0 + 10);
        EXPECT_EQ(g_CharsUsedNow, used0 + 10);
        CSettingsRefCountedConstString other("x");
        other = a;
        EXPECT_EQ(a.GetRefCount(), 3);
        EXPECT_EQ(g_CharsUsedNow, used0 + 10) << "\"x\" is unused now (if it was not in use before)";
    }
    EXPECT_EQ(g_CharsUsedNow, used0);
    EXPECT_EQ(g_CharsAllocatedTotal, total0 + 12) << "unused entries stay until a collection";

    const std::string sixteen(16, 's'), long40(40, 'l');
    CSettingsRefCountedConstString s16(sixteen), s40(long40), s15(std::string(15, 'f'));
    const auto& pool16 = CSettingsRefCountedConstString::GetPool(16);
    EXPECT_TRUE(pool16.count(sixteen) && pool16.count(long40));
    EXPECT_TRUE(CSettingsRefCountedConstString::GetPool(15).count(std::string(15, 'f')));

    CSettingsRefCountedConstString::CollectGarbage();
    const size_t entries0 = CSettingsRefCountedConstString::EntryCount();
    oxtest::LogCapture log;
    {
        // A total that stays at or below 4096: no collection, whatever is unused.
        std::vector<CSettingsRefCountedConstString> values;
        const int count = static_cast<int>((4096 - g_CharsAllocatedTotal) / 102);
        values.reserve(count);
        for (int i = 0; i < count; ++i)
            values.emplace_back(std::string(99, 'a') + std::to_string(i % 10) + std::to_string(i / 10));
        values.clear();
        EXPECT_LE(g_CharsAllocatedTotal, 4096u);
        EXPECT_EQ(CSettingsRefCountedConstString::EntryCount(), entries0 + count);
        EXPECT_FALSE(log.Contains("gc start."));
    }
    {
        // Past 4096 with more than 10% unused: the first release that tips it collects.
        std::vector<CSettingsRefCountedConstString> values;
        values.reserve(20);
        for (int i = 0; i < 20; ++i)
            values.emplace_back(std::string(99, 'b') + std::to_string(i % 10) + std::to_string(i / 10));
        EXPECT_GT(g_CharsAllocatedTotal, 4096u);
        EXPECT_FALSE(log.Contains("gc start")) << "nothing is released yet";
        values.pop_back();
        EXPECT_TRUE(log.Contains("CSettingsRefCountedConstString strings gc start. bytes: "));
        EXPECT_TRUE(log.Contains("CSettingsRefCountedConstString strings gc end. bytes: "));
        EXPECT_EQ(CSettingsRefCountedConstString::EntryCount(), entries0 + 19) << "every unused entry is erased";
        EXPECT_EQ(values.front().Get(), std::string(99, 'b') + "00") << "live values stay";
    }
}

TEST(SettingsIds, NamesNoTreeUsesAreReleased)
{
    // A large description whose element, attribute and child names are new on every round,
    // as a long session of varied files (or a fuzzer) gives them.
    auto description = [](int round) {
        std::string xml = "<?xml version=\"1.0\"?>\n<root>";
        for (int i = 0; i < 300; ++i) {
            const std::string n = std::to_string(round) + "_" + std::to_string(i);
            xml += "<el" + n + " at" + n + "=\"v" + n + "\"><named_object name=\"nm" + n + "\"><leaf/></named_object></el" + n + ">";
        }
        return xml + "</root>";
    };
    CSettings kept;
    ASSERT_TRUE(Load(kept, "<?xml version=\"1.0\"?><kept_root kept_value=\"1\"/>"));
    const StringA88* pinned = InternId("pinned_for_good");
    const size_t ids0 = IdCount();
    CSettingsRefCountedConstString::CollectGarbage();
    const size_t values0 = CSettingsRefCountedConstString::EntryCount();

    auto copy = boost::make_shared<CSettings>();
    for (int round = 0; round < 30; ++round) {
        CSettings settings;
        ASSERT_TRUE(Load(settings, description(round)));
        if (round == 0)
            settings.CopyTo(*copy);
    }
    EXPECT_EQ(IdCount(), ids0 + 902) << "only the copy's names are left (900, root and leaf)";
    const CSettingsGroup& element = copy->GetChild("root").GetChild("el0_7");
    EXPECT_EQ(element.GetValue("at0_7"), "v0_7");
    EXPECT_EQ(element.GetNamedChild("nm0_7").GetId().view(), "leaf");
    EXPECT_EQ(FindId("el1_7"), nullptr);

    copy.reset();
    EXPECT_EQ(IdCount(), ids0);
    EXPECT_EQ(FindId("el0_7"), nullptr);
    EXPECT_EQ(FindId("pinned_for_good"), pinned) << "a name handed out for good stays";
    EXPECT_EQ(kept.GetChild("kept_root").GetValue("kept_value"), "1");
    EXPECT_LT(CSettingsRefCountedConstString::EntryCount(), values0 + 1000) << "values are collected too";
}

TEST(SettingsReaders, TypedValuesAndBadInput)
{
    CSettingsGroup g;
    g.AddValue("t", "true");
    g.AddValue("T", "True");
    g.AddValue("i", "-12");
    g.AddValue("ispace", " 5");
    g.AddValue("ifrac", "1.5");
    g.AddValue("f", "2.25");
    g.AddValue("fbad", "abc");
    g.AddValue("empty", "");
    g.AddValue("v", "1.5 -2");
    g.AddValue("vhalf", "3.5");
    g.AddValue("c", "#255 1 2 3");
    g.AddValue("coct", "#0 010 0x10 0");
    g.AddValue("cwhite", "-1");
    g.AddValue("cred", "16711680");

    EXPECT_TRUE(ReadBool(g, "t"));
    EXPECT_FALSE(ReadBool(g, "T"));
    EXPECT_EQ(ReadInt(g, "i"), -12);
    EXPECT_EQ(ReadInt(g, "empty"), 0);
    EXPECT_EQ(ReadInt(g, "absent"), 0);
    EXPECT_THROW(ReadInt(g, "ispace"), boost::bad_lexical_cast);
    EXPECT_THROW(ReadInt(g, "ifrac"), boost::bad_lexical_cast);
    EXPECT_FLOAT_EQ(ReadFloat(g, "f"), 2.25f);
    EXPECT_THROW(ReadFloat(g, "fbad"), boost::bad_lexical_cast);
    EXPECT_EQ(ReadVector(g, "v"), (ox::misc::Vector<float>(1.5f, -2.0f)));
    EXPECT_EQ(ReadVector(g, "vhalf"), (ox::misc::Vector<float>(3.5f, 0.0f)));
    EXPECT_EQ(ReadVector(g, "fbad"), (ox::misc::Vector<float>()));

    EXPECT_EQ(ReadColor(g, "empty"), Color(0u));
    EXPECT_EQ(ReadColor(g, "c"), Color(1, 2, 3, 255));
    EXPECT_EQ(ReadColor(g, "coct"), Color(8, 16, 0, 0)) << "%hi: a leading 0 is octal, 0x hexadecimal";
    EXPECT_EQ(ReadColor(g, "cwhite"), Color());
    EXPECT_EQ(ReadColor(g, "cred"), Color(255, 0, 0, 0));

    int kept = 7;
    EXPECT_FALSE(ReadInt(g, "absent", kept));
    EXPECT_EQ(kept, 7);
    EXPECT_TRUE(ReadInt(g, "empty", kept));
    EXPECT_EQ(kept, 0);
    Color color(0x11223344u);
    EXPECT_FALSE(ReadColor(g, "absent", color));
    EXPECT_EQ(color.GetARGB(), 0x11223344u);
}
