// The dump tool's particles: what it compiles from a folder is the table the game builds from
// the same XML, and `show` describes it.
#include "core/ParticlesLoader.h"
#include "misc/GamePack.h"
#include "support/TestSupport.h"

#include <cstring>
#include <sys/wait.h>

namespace {

int RunDump(const std::string& arguments, std::string& output)
{
    oxtest::TempDir dir;
    const std::string file = (dir / "out").string();
    const int status = system((std::string(OX_OXDUMP_PATH) + " " + arguments + " >'" + file + "' 2>&1").c_str());
    output = oxtest::ReadFile(file);
    return WEXITSTATUS(status);
}

} // namespace

TEST(OxDumpParticles, CompilesWhatTheGameBuildsAndShowsIt)
{
    oxtest::TempDir game;
    oxtest::ScopedCwd cwd(game.Path());
    game.Write("properties/particles/fire.xml", R"(<?xml version="1.0"?><systems>
        <particle id="smoke" emission="20" life_time_max="900" flags="2048" tex_id="puff" size="1 2 3 0 0"/>
        <particle id="ember" emission="5" spread="0.5"/></systems>)");
    game.Write("properties/particles/rain.xml", R"(<?xml version="1.0"?><particle id="drop" grav_max="300"/>)");

    std::string text;
    ASSERT_EQ(RunDump("particles properties/particles particles.bindump", text), 0) << text;
    EXPECT_NE(text.find("particles.bindump: 3 particle systems, 1160 bytes"), std::string::npos) << text;

    ox::misc::GamePackConfig config;
    config.folder = game.Path().string();
    config.language = "";
    ox::misc::CGamePack pack(config);
    ox::core::CParticlesLoader loader(&pack);
    ASSERT_TRUE(loader.Load());
    ASSERT_TRUE(loader.IsBuiltFromXml());
    const std::string dump = oxtest::ReadFile(game / "particles.bindump");
    ASSERT_EQ(dump.size(), loader.DataSize());
    EXPECT_EQ(memcmp(dump.data(), loader.Data(), dump.size()), 0) << "one builder for the tool and the game";

    ASSERT_EQ(RunDump("show particles.bindump", text), 0) << text;
    EXPECT_NE(text.find("particles, version 1: 3 systems\nparticle drop"), std::string::npos) << text;
    EXPECT_NE(text.find("particle smoke texture 'puff' at 0,0 flags 0x800\n  emission 20, cap 0, system life 0ms, "
                        "particle life 0..900ms"), std::string::npos) << text;

    game.Write("bad.bindump", dump.substr(0, dump.size() - 1));
    EXPECT_EQ(RunDump("show bad.bindump", text), 1) << text;
    EXPECT_NE(text.find("its record count does not match its size"), std::string::npos) << text;
}
