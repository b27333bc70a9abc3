// The monkey test: the demo played headless on the test clock by random input for a fixed
// number of frames: clicks, right clicks, double clicks, drags, the wheel, keys and text, all
// through the platform adapter as a player's would come. The run fails on a crash, a contract
// failure, a "Lua Error" or a log line of level error. The input follows a seed, printed, so a
// failing run is played again with OX_MONKEY_SEED=<seed>.
#include "core/TimeManager.h"
#include "diag/Assert.h"
#include "game/App.h"
#include "gui/WidgetManager.h"
#include "gui/Window.h"
#include "DemoChild.h"
#include "support/TestSupport.h"

#include <SDL.h>

#include <cstdio>
#include <deque>
#include <fstream>
#include <random>
#include <vector>

namespace fs = std::filesystem;
using namespace ox;

namespace {

constexpr int kFrames = 1250;      // 25 s of game time
constexpr int kFrameStep = 20;     // ms a frame on the test clock
constexpr uint32_t kDefaultSeed = 20261126;

uint32_t Seed()
{
    const char* value = getenv("OX_MONKEY_SEED");
    return value && *value ? static_cast<uint32_t>(strtoul(value, nullptr, 10)) : kDefaultSeed;
}

// The top-left corner of `widget` of `window` on the canvas.
misc::FloatVector Corner(gui::CBaseWindow* window, const gui::CWidget& widget)
{
    misc::FloatVector corner = widget.GetAbsPos(false);
    for (gui::CBaseWindow* w = window; w; w = w->GetParentWindow())
        corner += w->GetOffset();
    return corner;
}

// The widgets under `widget` a player could press: shown, enabled, with a size.
void Pressable(const gui::CBaseWidget& widget, std::vector<gui::CWidget*>& out)
{
    for (const gui::WidgetPtrT& child : widget.GetWidgets()) {
        if (child->GetFlags() & (gui::FlagHidden | gui::FlagDisabled))
            continue;
        if (child->GetSize().X > 0 && child->GetSize().Y > 0)
            out.push_back(child.get());
        Pressable(*child, out);
    }
}

// The monkey's hands: each frame maybe a new action, whose SDL events fall on this and the
// next frames.
class CMonkey {
public:
    explicit CMonkey(uint32_t seed) : m_Random(seed) {}

    // Pushes the events due in this frame; those of a new action start now.
    void Act(core::CApplication& app)
    {
        if (m_Due.empty() && Roll(4) == 0)
            Plan(app);
        if (!m_Due.empty()) {
            for (SDL_Event& event : m_Due.front())
                SDL_PushEvent(&event);
            m_Due.pop_front();
        }
    }
    int Actions() const { return m_Actions; }

private:
    int Roll(int n) { return static_cast<int>(m_Random() % static_cast<uint32_t>(n)); }
    misc::IntVector Point() { return {Roll(1024), Roll(768)}; }
    // The centre of a widget of `window` picked at random (a random point when it has none):
    // the monkey finds the buttons of the menus more often than by chance.
    misc::IntVector Aim(gui::CBaseWindow* window)
    {
        std::vector<gui::CWidget*> widgets;
        if (window)
            Pressable(*window, widgets);
        if (widgets.empty())
            return Point();
        const gui::CWidget& widget = *widgets[Roll(static_cast<int>(widgets.size()))];
        const misc::FloatVector centre = Corner(window, widget) + widget.GetSize() * 0.5f;
        return {static_cast<int>(centre.X), static_cast<int>(centre.Y)};
    }
    // A canvas point in the window's client pixels, where SDL reports the mouse.
    static misc::IntVector Client(core::CApplication& app, misc::IntVector at)
    {
        const gui::CWidgetManager& manager = app.GetWidgetManager();
        const misc::FloatRect& rect = manager.GetActiveRect();
        return {static_cast<int>(rect.X + static_cast<float>(at.X) * manager.GetScale().X),
                static_cast<int>(rect.Y + static_cast<float>(at.Y) * manager.GetScale().Y)};
    }

    // Frame `frame` from now gets `event`.
    void At(size_t frame, const SDL_Event& event)
    {
        if (m_Due.size() <= frame)
            m_Due.resize(frame + 1);
        m_Due[frame].push_back(event);
    }
    void Move(size_t frame, misc::IntVector at)
    {
        SDL_Event event {};
        event.type = SDL_MOUSEMOTION;
        event.motion.x = at.X;
        event.motion.y = at.Y;
        At(frame, event);
    }
    void Button(size_t frame, misc::IntVector at, bool down, uint8_t button, uint8_t clicks = 1)
    {
        SDL_Event event {};
        event.type = down ? SDL_MOUSEBUTTONDOWN : SDL_MOUSEBUTTONUP;
        event.button.button = button;
        event.button.state = down ? SDL_PRESSED : SDL_RELEASED;
        event.button.clicks = clicks;
        event.button.x = at.X;
        event.button.y = at.Y;
        At(frame, event);
    }
    void Key(size_t frame, SDL_Scancode scancode, uint16_t mod)
    {
        SDL_Event event {};
        event.key.keysym.scancode = scancode;
        event.key.keysym.sym = SDL_GetKeyFromScancode(scancode);
        event.key.keysym.mod = mod;
        event.type = SDL_KEYDOWN;
        event.key.state = SDL_PRESSED;
        At(frame, event);
        event.type = SDL_KEYUP;
        event.key.state = SDL_RELEASED;
        At(frame + 1, event);
    }
    void Text(size_t frame, const char* text)
    {
        SDL_Event event {};
        event.type = SDL_TEXTINPUT;
        snprintf(event.text.text, sizeof(event.text.text), "%s", text);
        At(frame, event);
    }

    void Plan(core::CApplication& app)
    {
        ++m_Actions;
        const misc::IntVector at = Client(app, Roll(3) == 0 ? Aim(app.GetTopWindow()) : Point());
        switch (Roll(10)) {
        case 0: case 1: case 2: // a click, most of what a player does
            Move(0, at);
            Button(1, at, true, SDL_BUTTON_LEFT);
            Button(2, at, false, SDL_BUTTON_LEFT);
            return;
        case 3:
            Move(0, at);
            Button(1, at, true, SDL_BUTTON_RIGHT);
            Button(2, at, false, SDL_BUTTON_RIGHT);
            return;
        case 4:
            Move(0, at);
            Button(1, at, true, SDL_BUTTON_LEFT);
            Button(1, at, false, SDL_BUTTON_LEFT);
            Button(2, at, true, SDL_BUTTON_LEFT, 2);
            Button(2, at, false, SDL_BUTTON_LEFT, 2);
            return;
        case 5: { // a drag over a few frames
            const misc::IntVector to = Client(app, Point());
            Move(0, at);
            Button(1, at, true, SDL_BUTTON_LEFT);
            const int steps = 2 + Roll(8);
            for (int i = 1; i <= steps; ++i)
                Move(1 + i, {at.X + (to.X - at.X) * i / steps, at.Y + (to.Y - at.Y) * i / steps});
            Button(2 + steps, to, false, SDL_BUTTON_LEFT);
            return;
        }
        case 6: {
            SDL_Event event {};
            event.type = SDL_MOUSEWHEEL;
            event.wheel.y = Roll(2) ? 1 : -1;
            Move(0, at);
            At(1, event);
            return;
        }
        case 7: case 8: { // keys, sometimes with Shift or Ctrl, never Alt (Ctrl+Alt+P plays a replay)
            static const SDL_Scancode keys[] = {
                SDL_SCANCODE_ESCAPE, SDL_SCANCODE_RETURN, SDL_SCANCODE_SPACE, SDL_SCANCODE_TAB,
                SDL_SCANCODE_BACKSPACE, SDL_SCANCODE_DELETE, SDL_SCANCODE_LEFT, SDL_SCANCODE_RIGHT,
                SDL_SCANCODE_UP, SDL_SCANCODE_DOWN, SDL_SCANCODE_HOME, SDL_SCANCODE_END,
                SDL_SCANCODE_PAGEUP, SDL_SCANCODE_PAGEDOWN, SDL_SCANCODE_A, SDL_SCANCODE_C,
                SDL_SCANCODE_V, SDL_SCANCODE_X, SDL_SCANCODE_Z, SDL_SCANCODE_1, SDL_SCANCODE_F1,
                SDL_SCANCODE_F5, SDL_SCANCODE_F10};
            static const uint16_t mods[] = {KMOD_NONE, KMOD_NONE, KMOD_NONE, KMOD_LSHIFT, KMOD_LCTRL};
            Key(0, keys[Roll(std::size(keys))], mods[Roll(std::size(mods))]);
            return;
        }
        default: { // text, Latin and Cyrillic
            static const char* texts[] = {"a", "Zz", "hello", "42", "Фонарь", "ё", "!?", " "};
            Text(0, texts[Roll(std::size(texts))]);
            return;
        }
        }
    }

    std::mt19937 m_Random;
    std::deque<std::vector<SDL_Event>> m_Due;
    int m_Actions = 0;
};

// The game whose every frame starts with the monkey's hands, until the frames are spent.
class CMonkeyApp : public k17::CApp {
public:
    explicit CMonkeyApp(uint32_t seed) : m_Monkey(seed) {}

    void Update() override
    {
        if (++m_Frame > kFrames) {
            Stop();
            return;
        }
        // Until the main menu has come, loading runs undisturbed.
        if (m_Menu || (GetTopWindow() && GetTopWindow()->GetId() == "main_menu")) {
            m_Menu = true;
            DisableQuit();
            m_Monkey.Act(*this);
        }
        k17::CApp::Update();
    }
    int Frames() const { return std::min(m_Frame, kFrames); }

    // The main menu's Quit would end the run early: it takes no input while the monkey plays.
    void DisableQuit()
    {
        for (gui::CBaseWindow* window = GetMainWindow(); window; window = window->GetChildWindow())
            if (gui::CWidget* quit = window->GetWidget("quit", true))
                quit->AddFlags(gui::FlagDisabled);
    }
    int Actions() const { return m_Monkey.Actions(); }

private:
    CMonkey m_Monkey;
    int m_Frame = 0;
    bool m_Menu = false;
};

int g_ContractFailures = 0;

int PlayTheMonkey()
{
    diag::SetAssertHandler([](const wchar* expression, const wchar* file, int line) {
        ++g_ContractFailures;
        printf("monkey: contract failure \"%s\" at %s:%d\n", oxtest::Narrow(expression).c_str(),
               oxtest::Narrow(file).c_str(), line);
        fflush(stdout);
    });
    core::GetTimeManager().SetFixedStep(kFrameStep);
    const uint32_t seed = Seed();
    CMonkeyApp app(seed);
    app.ReadGameFolder();
    if (!app.Init())
        return 10;
    app.LimitFPS(0);
    gui::BaseWindowPtrT loading = app.CreateLoadWindow();
    app.SetMainWindow(loading);
    app.Run();
    printf("monkey: seed %u, %d frames, %d actions\n", seed, app.Frames(), app.Actions());
    loading.reset();
    app.DoShutdown();
    return g_ContractFailures ? 70 : 0;
}

// The lines of level error in the game's log under `folder`; false when there is no log.
bool ErrorLines(const fs::path& folder, std::vector<std::string>& lines)
{
    bool found = false;
    for (const auto& entry : fs::recursive_directory_iterator(folder)) {
        if (entry.path().filename() != "log.oxlog")
            continue;
        found = true;
        std::ifstream log(entry.path());
        for (std::string line; std::getline(log, line);)
            if (line.find("][3]: ") != std::string::npos)
                lines.push_back(line);
    }
    return found;
}

} // namespace

TEST(Monkey, RandomInputForAFixedNumberOfFramesBreaksNothing)
{
    const uint32_t seed = Seed();
    printf("monkey seed %u (OX_MONKEY_SEED=%u plays this run again)\n", seed, seed);
    fflush(stdout);
    oxtest::DemoChild demo;
    const int result = demo.Run(&PlayTheMonkey, 180);
    const std::string output = demo.Output();
    const std::string errors = demo.Errors();
    EXPECT_EQ(result, 0) << "seed " << seed << " (-1: a crash, 99: out of time, 70: a contract failure)\n"
                         << output << errors;
    // The monkey got to the main menu and played from there.
    const size_t summary = output.find("monkey: seed");
    ASSERT_NE(summary, std::string::npos) << output;
    printf("%s\n", output.substr(summary, output.find('\n', summary) - summary).c_str());
    EXPECT_EQ(output.find(", 0 actions", summary), std::string::npos) << output;
    EXPECT_NE(output.find(", " + std::to_string(kFrames) + " frames", summary), std::string::npos)
        << "the game stopped before the monkey was through\n" << output;
    EXPECT_EQ(output.find("Lua Error"), std::string::npos) << "seed " << seed << "\n" << output;
    EXPECT_EQ(errors.find("Lua Error"), std::string::npos) << "seed " << seed << "\n" << errors;
    std::vector<std::string> logged;
    ASSERT_TRUE(ErrorLines(demo.dir / "xdg", logged)) << "the game wrote no log.oxlog";
    EXPECT_TRUE(logged.empty()) << "seed " << seed << ": " << logged.size() << " error lines, the first: "
                                << (logged.empty() ? "" : logged.front());
}
