#include "misc/XmlParser.h"
#include "support/TestSupport.h"

#include <string>
#include <vector>

using namespace ox::misc;

namespace {

// Every callback as one line: "S name@depth", "A name=value@depth", "D@depth", "E name@depth",
// "T text@depth"; a "u" after the depth marks a UTF-8 file.
struct Trace {
    std::vector<std::string> events;
    XmlParseProblem problem;
    bool accepted = false;

    static Trace& Of(void* user) { return *static_cast<Trace*>(user); }
    static std::string At(int depth, bool utf8 = false) { return "@" + std::to_string(depth) + (utf8 ? "u" : ""); }
};

Trace Parse(const std::string& xml)
{
    Trace trace;
    // A copy of exactly the bytes, with no terminator behind them.
    std::vector<char> bytes(xml.begin(), xml.end());
    trace.accepted = ParseXml(
        bytes.data(), bytes.size(), &trace,
        [](void* u, XmlRecord* s, int d) { Trace::Of(u).events.push_back("S " + std::string(s[d].name, s[d].nameLength) + Trace::At(d)); },
        [](void* u, XmlRecord*, int d, const char* n, size_t nl, const char* v, size_t vl, bool utf8) {
            Trace::Of(u).events.push_back("A " + std::string(n, nl) + "=" + std::string(v, vl) + Trace::At(d, utf8));
        },
        [](void* u, XmlRecord*, int d) { Trace::Of(u).events.push_back("D" + Trace::At(d)); },
        [](void* u, XmlRecord* s, int d) { Trace::Of(u).events.push_back("E " + std::string(s[d].name, s[d].nameLength) + Trace::At(d)); },
        [](void* u, XmlRecord* s, int d, bool utf8) {
            Trace::Of(u).events.push_back("T " + std::string(s[d].text, s[d].textLength) + Trace::At(d, utf8));
        },
        &trace.problem);
    return trace;
}

using Events = std::vector<std::string>;

} // namespace

TEST(XmlParser, ElementsAttributesTextAndComments)
{
    Trace t = Parse("<?xml version=\"1.0\"?>\n"
                    "<root a=\"1\" b='say \"hi\"'>\n"
                    "  <leaf>some text</leaf>\n"
                    "  <empty/>\n"
                    "  <!-- a > comment --><c x=\"it's\"></>\n"
                    "</root>");
    EXPECT_TRUE(t.accepted);
    EXPECT_EQ(t.events, (Events{"S root@0", "A a=1@0", "A b=say \"hi\"@0", "D@0",
                                "S leaf@1", "D@1", "T some text@1", "E leaf@1",
                                "S empty@1", "D@1", "E empty@1",
                                "S c@1", "A x=it's@1", "D@1", // "</>" closes without callbacks
                                "E root@0"}))
        << "the root has children, so no text of its own";
    EXPECT_TRUE(t.problem.what.empty());

    // A comment inside a leaf also takes its text away.
    t = Parse("<xml><a>text<!-- c --></a><b>kept</b></xml>");
    EXPECT_EQ(t.events, (Events{"S a@0", "D@0", "E a@0", "S b@0", "D@0", "T kept@0", "E b@0"}))
        << "a bare <xml> head is accepted and its close is skipped";
}

TEST(XmlParser, DecodesReferencesInValuesAndText)
{
    Trace t = Parse("<xml><a v=\"x&amp;y\" h=\"&#x41;&#x7;\" l=\"&lt;&gt;&quot;&apos;\" d=\"&#65;\" "
                    "lower=\"&#x4a;\" cut=\"&am\">1 &lt; 2</a></xml>");
    EXPECT_EQ(t.events, (Events{"S a@0", "A v=x&y@0", std::string("A h=A\x07@0"), "A l=<>\"'@0",
                                std::string("A d=\x05@0"), // the three characters before the digits are not checked
                                std::string("A lower=\x04" "a;@0"), // only upper-case hex digits
                                std::string("A cut=\0@0", 9), "D@0", "T 1 < 2@0", "E a@0"}));
}

TEST(XmlParser, HeadDecidesAcceptanceAndEncoding)
{
    EXPECT_FALSE(Parse("<a b=\"1\"").accepted) << "no \">\"";
    EXPECT_FALSE(Parse("<?html?><a/>").accepted) << "the head must name xml";
    EXPECT_FALSE(Parse("<?xml " + std::string(248, ' ') + "?><a/>").accepted) << "head of 256 bytes";
    EXPECT_TRUE(Parse("<?xml " + std::string(247, ' ') + "?><a/>").accepted) << "head of 255 bytes";

    Trace utf8 = Parse("<?xml version=\"1.0\" encoding=\"UTF-8\"?><a v=\"1\"/>");
    EXPECT_EQ(utf8.events, (Events{"S a@0", "A v=1@0u", "D@0", "E a@0"}));
    Trace lower = Parse("<?xml encoding=\"utf-8\"?><a v=\"1\"/>");
    EXPECT_EQ(lower.events[1], "A v=1@0u");

    EXPECT_CONTRACT_FAILURE(EXPECT_FALSE(ParseXml(nullptr, 0, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr)),
                            "_data");
}

TEST(XmlParser, Utf8QuoteScanStepsWholeCharacters)
{
    // 0xC3 leads a two-byte character: in a UTF-8 file the quote behind it is swallowed.
    const std::string body = "<a v=\"\xC3\"x\" w=\"\xE2\x82\xAC\"/>";
    Trace utf8 = Parse("<?xml encoding=\"UTF-8\"?>" + body);
    EXPECT_EQ(utf8.events, (Events{"S a@0", "A v=\xC3\"x@0u", "A w=\xE2\x82\xAC@0u", "D@0", "E a@0"}));
    Trace bytes = Parse("<?xml?>" + body);
    EXPECT_EQ(bytes.events[1], "A v=\xC3@0");

    // A lead byte whose character would run past the end of the data ends the scan there.
    Trace cut = Parse("<?xml encoding=\"UTF-8\"?><a v=\"ab\xF0\"");
    EXPECT_TRUE(cut.accepted);
    EXPECT_EQ(cut.events, (Events{"S a@0"}));
    EXPECT_EQ(cut.problem.what, "an attribute value is not closed");
}

TEST(XmlParser, BrokenBodiesStopWithAProblemAndLine)
{
    Trace comment = Parse("<xml>\n<a/>\n<!-- open\n<b/>");
    EXPECT_TRUE(comment.accepted);
    EXPECT_EQ(comment.events, (Events{"S a@0", "D@0", "E a@0"}));
    EXPECT_EQ(comment.problem.what, "a comment is not closed");
    EXPECT_EQ(comment.problem.line, 3u);

    Trace unclosed = Parse("<xml>\n<a>\n<b>");
    EXPECT_TRUE(unclosed.accepted);
    EXPECT_EQ(unclosed.problem.what, "elements are not closed at the end of the data");
    EXPECT_EQ(unclosed.problem.line, 3u);

    Trace slash = Parse("<xml><a / ><b/>");
    EXPECT_EQ(slash.events, (Events{"S a@0", "D@0"}));
    EXPECT_EQ(slash.problem.what, "\"/\" is not followed by \">\"");

    Trace stray = Parse("<xml></x><a/></");
    EXPECT_EQ(stray.events, (Events{"S a@0", "D@0", "E a@0"}));

    std::string deep = "<xml>";
    for (int i = 0; i < 65; ++i)
        deep += "<e>";
    Trace tooDeep = Parse(deep);
    EXPECT_FALSE(tooDeep.accepted) << "nesting deeper than 64 refuses the file";
    EXPECT_EQ(tooDeep.events.size(), 64u * 2);
    EXPECT_EQ(tooDeep.problem.what, "elements are nested deeper than 64");
}
