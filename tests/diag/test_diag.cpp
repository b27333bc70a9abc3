#include "diag/Assert.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "support/TestSupport.h"

#include <regex>

using namespace ox::diag;
using oxtest::FakeClock;
using oxtest::TempDir;

TEST(Log, LineFormatLevelsAndFlushing)
{
    TempDir dir;
    FakeClock clock;
    clock.Set(5000);
    Log log(clock.Ticks());
    auto path = dir / "log.oxlog";

    log.Write("core", LogInfo, "before the file");
    EXPECT_FALSE(std::filesystem::exists(path)) << "logging before SetFile must not create the file";

    log.SetFile(path.string());
    clock.Advance(3141);
    log.Write("core", LogInfo, "CSettings::LoadXml loading %s", "game.xml");
    clock.Advance(100.0 * 3600000); // a hundred hours widen the hours field
    log.Write("app", LogWarning, u"wide %ls %i", u"\u0416", 7);

    // A warning is not flushed at once; an error is, and takes the earlier lines with it.
    EXPECT_EQ(oxtest::ReadFile(path).find("wide"), std::string::npos);
    log.Write("app", LogError, "bad %d%%", 5);
    std::string text = oxtest::ReadFile(path);
    EXPECT_EQ(text, "[00:00:00:000][log][1]: log created\n"
                    "[00:00:03:141][core][1]: CSettings::LoadXml loading game.xml\n"
                    "[100:00:03:141][app][2]: wide \xD0\x96 7\n"
                    "[100:00:03:141][app][3]: bad 5%\n");

    log.SetTraceOff(true);
    log.Write("core", LogTrace, "dropped");
    log.Close();
    text = oxtest::ReadFile(path);
    EXPECT_EQ(text.find("dropped"), std::string::npos);
    EXPECT_NE(text.find("[log][1]: log destroyed\n"), std::string::npos);
}

TEST(Log, UnopenableFileDropsLines)
{
    Log log;
    log.SetFile(std::string("/nonexistent-folder/x/log.oxlog"));
    EXPECT_FALSE(log.IsOpen());
    log.Write("core", LogError, "nothing happens");
}

TEST(Message, ShowLogsThenReachesTheSinkUnlessSuppressed)
{
    oxtest::LogCapture log;
    oxtest::MessageCapture boxes;
    message::Show(u"Lua Error", u"line 3: \u00e9");
    message::Show("plain");
    message::ShowFormat("Error", "%s has %d", "file", 2);
    message::Supress(true);
    message::Show(u"hidden");
    message::Supress(false);

    ASSERT_EQ(boxes.Boxes().size(), 3u);
    EXPECT_EQ(boxes.Boxes()[0].caption, "Lua Error");
    EXPECT_EQ(boxes.Boxes()[0].text, "line 3: \xC3\xA9");
    EXPECT_EQ(boxes.Boxes()[1].caption, "Message");
    EXPECT_EQ(boxes.Boxes()[2].text, "file has 2");

    auto entries = log.Entries();
    EXPECT_NE(std::find(entries.begin(), entries.end(), "message|1|caption: Lua Error\nmessage: line 3: \xC3\xA9"),
              entries.end());
    EXPECT_TRUE(log.Contains("message: hidden")) << "a suppressed box is still logged";
}

TEST(Message, OverlongFormatIsAContractFailure)
{
    oxtest::MessageCapture boxes;
    std::string big(3000, 'x');
    EXPECT_CONTRACT_FAILURE(message::ShowFormat("Error", "%s", big.c_str()), "result != -1");
    EXPECT_TRUE(boxes.Boxes().empty());
}

TEST(Assert, LogsExpressionFileAndLineAndHonoursSupress)
{
    oxtest::LogCapture log;
    int line = 0;
    {
        oxtest::AssertCapture capture;
        line = __LINE__ + 1;
        OX_ASSERT(1 + 1 == 3);
        ASSERT_EQ(capture.Count(), 1u);
        EXPECT_EQ(capture.Failures()[0].expression, "1 + 1 == 3");
        EXPECT_EQ(capture.Failures()[0].file, "tests/diag/test_diag.cpp");
        EXPECT_EQ(capture.Failures()[0].line, line);

        message::Supress(true);
        OX_ASSERT(false);
        message::Supress(false);
        EXPECT_EQ(capture.Count(), 1u) << "a suppressed failure does not reach the handler";

        OX_ASSERT_A(2 < 1);
        EXPECT_EQ(capture.Count(), 1u) << "the narrow form never stops the run";
    }
    auto entries = log.Entries();
    std::string expected = "assert|3|assertion failed \"1 + 1 == 3\", file \"tests/diag/test_diag.cpp\" line " +
                           std::to_string(line);
    EXPECT_NE(std::find(entries.begin(), entries.end(), expected), entries.end());
    EXPECT_TRUE(log.Contains("assertion failed \"false\""));
    EXPECT_TRUE(log.Contains("assertion failed \"2 < 1\""));
}

namespace {
int GuardedValue(int value)
{
    OX_CHECK_DATA(value >= 0, -1);
    return value * 2;
}
void GuardedVoid(bool ok, int& calls)
{
    OX_CHECK_DATA(ok);
    ++calls;
}
} // namespace

TEST(Assert, DataCheckLogsAndReturnsWithoutStoppingTheRun)
{
    oxtest::LogCapture log;
    oxtest::AssertCapture capture;
    EXPECT_EQ(GuardedValue(4), 8);
    EXPECT_EQ(GuardedValue(-3), -1);
    int calls = 0;
    GuardedVoid(false, calls);
    GuardedVoid(true, calls);
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(capture.Count(), 0u) << "a data check never reaches the assertion handler";
    auto entries = log.Entries();
    EXPECT_TRUE(std::any_of(entries.begin(), entries.end(), [](const std::string& entry) {
        return entry.starts_with("data|3|check failed \"value >= 0\", file \"tests/diag/test_diag.cpp\" line ");
    }));
    EXPECT_TRUE(log.Contains("check failed \"ok\""));
}
