#include "core/platform/SdlEventTranslation.h"
#include "core/platform/StandaloneApplicationSdl.h"
#include "support/TestSupport.h"

using namespace ox::core;

namespace {

std::vector<SystemEvent> Translate(const SDL_Event& event, const TranslationState& state = {})
{
    std::vector<SystemEvent> out;
    TranslateSdlEvent(event, state, out);
    return out;
}

SDL_Event Key(Uint32 type, SDL_Keycode sym, SDL_Scancode scancode, Uint16 mod = 0, Uint8 repeat = 0)
{
    SDL_Event e {};
    e.type = type;
    e.key.keysym.sym = sym;
    e.key.keysym.scancode = scancode;
    e.key.keysym.mod = mod;
    e.key.repeat = repeat;
    return e;
}

SystemEvent Message(uint32_t message, uint32_t wParam, uint32_t lParam)
{
    SystemEvent e;
    e.message = message;
    e.wParam = wParam;
    e.lParam = lParam;
    return e;
}

} // namespace

TEST(SdlTranslation, KeysBecomeVirtualKeysWithControlCharacters)
{
    EXPECT_EQ(VirtualKeyFromSdl(SDLK_p, SDL_SCANCODE_P), 'P');
    EXPECT_EQ(VirtualKeyFromSdl(SDLK_7, SDL_SCANCODE_7), '7');
    EXPECT_EQ(VirtualKeyFromSdl(SDLK_F1, SDL_SCANCODE_F1), 0x70u);
    EXPECT_EQ(VirtualKeyFromSdl(SDLK_PAGEUP, SDL_SCANCODE_PAGEUP), 0x21u);
    EXPECT_EQ(VirtualKeyFromSdl(SDLK_PAGEDOWN, SDL_SCANCODE_PAGEDOWN), 0x22u);

    auto down = Translate(Key(SDL_KEYDOWN, SDLK_PAGEUP, SDL_SCANCODE_PAGEUP));
    ASSERT_EQ(down.size(), 1u);
    EXPECT_EQ(down[0], Message(WM_KEYDOWN, VK_PRIOR, 1u | (SDL_SCANCODE_PAGEUP << 16)));
    auto up = Translate(Key(SDL_KEYUP, SDLK_PAGEUP, SDL_SCANCODE_PAGEUP));
    EXPECT_EQ(up[0].message, WM_KEYUP);
    EXPECT_EQ(up[0].lParam >> 30, 3u) << "previous state and transition bits";
    auto repeat = Translate(Key(SDL_KEYDOWN, SDLK_a, SDL_SCANCODE_A, 0, 1));
    EXPECT_EQ((repeat[0].lParam >> 30) & 1, 1u);

    auto back = Translate(Key(SDL_KEYDOWN, SDLK_BACKSPACE, SDL_SCANCODE_BACKSPACE));
    ASSERT_EQ(back.size(), 2u);
    EXPECT_EQ(back[1].message, WM_CHAR);
    EXPECT_EQ(back[1].wParam, 8u);
    auto ctrlC = Translate(Key(SDL_KEYDOWN, SDLK_c, SDL_SCANCODE_C, KMOD_LCTRL));
    ASSERT_EQ(ctrlC.size(), 2u);
    EXPECT_EQ(ctrlC[1].wParam, 3u);
    // Ctrl+Alt+P stays an ordinary key-down (the replay key); Alt alone makes system keys.
    auto ctrlAltP = Translate(Key(SDL_KEYDOWN, SDLK_p, SDL_SCANCODE_P, KMOD_LCTRL | KMOD_LALT));
    ASSERT_EQ(ctrlAltP.size(), 1u);
    EXPECT_EQ(ctrlAltP[0].message, WM_KEYDOWN);
    EXPECT_EQ(Translate(Key(SDL_KEYDOWN, SDLK_x, SDL_SCANCODE_X, KMOD_LALT))[0].message, WM_SYSKEYDOWN);
}

TEST(SdlTranslation, TextInputBecomesUtf16Characters)
{
    SDL_Event e {};
    e.type = SDL_TEXTINPUT;
    strcpy(e.text.text, "\xD0\x96\xF0\x9F\x98\x80"); // U+0416, U+1F600
    auto out = Translate(e);
    ASSERT_EQ(out.size(), 3u);
    EXPECT_EQ(out[0], Message(WM_CHAR, 0x0416, 1));
    EXPECT_EQ(out[1].wParam, 0xD83Du);
    EXPECT_EQ(out[2].wParam, 0xDE00u);
}

TEST(SdlTranslation, MouseButtonsWheelAndMotion)
{
    TranslationState state;
    state.modifiers = KMOD_LSHIFT;
    state.mouseButtons = SDL_BUTTON_LMASK;
    state.windowX = 100;
    state.windowY = 50;
    state.mouseX = 10;
    state.mouseY = 20;

    SDL_Event e {};
    e.type = SDL_MOUSEBUTTONDOWN;
    e.button.button = SDL_BUTTON_LEFT;
    e.button.clicks = 1;
    e.button.x = -3;
    e.button.y = 700;
    auto single = Translate(e, state);
    EXPECT_EQ(single[0], Message(WM_LBUTTONDOWN, MK_LBUTTON | MK_SHIFT, MakeLong(-3, 700)));
    EXPECT_EQ(LowWordSigned(single[0].lParam), -3);
    e.button.clicks = 2;
    EXPECT_EQ(Translate(e, state)[0].message, WM_LBUTTONDBLCLK);
    e.button.clicks = 3;
    EXPECT_EQ(Translate(e, state)[0].message, WM_LBUTTONDOWN);
    e.type = SDL_MOUSEBUTTONUP;
    e.button.button = SDL_BUTTON_RIGHT;
    EXPECT_EQ(Translate(e, state)[0].message, WM_RBUTTONUP);

    SDL_Event wheel {};
    wheel.type = SDL_MOUSEWHEEL;
    wheel.wheel.y = -2;
    auto w = Translate(wheel, state);
    ASSERT_EQ(w.size(), 1u);
    EXPECT_EQ(HighWordSigned(w[0].wParam), -240);
    EXPECT_EQ(w[0].lParam, MakeLong(110, 70)) << "screen coordinates";

    SDL_Event motion {};
    motion.type = SDL_MOUSEMOTION;
    motion.motion.x = 5;
    motion.motion.y = 6;
    auto m = Translate(motion, state);
    ASSERT_EQ(m.size(), 2u);
    EXPECT_EQ(m[0].message, WM_SETCURSOR);
    EXPECT_EQ(m[1], Message(WM_MOUSEMOVE, MK_LBUTTON | MK_SHIFT, MakeLong(5, 6)));
}

TEST(SdlTranslation, WindowEvents)
{
    SDL_Event e {};
    e.type = SDL_WINDOWEVENT;
    TranslationState state;
    state.clientWidth = 1024;
    state.clientHeight = 768;
    e.window.event = SDL_WINDOWEVENT_MINIMIZED;
    EXPECT_EQ(Translate(e, state)[0], Message(WM_SIZE, SIZE_MINIMIZED, 0));
    e.window.event = SDL_WINDOWEVENT_RESTORED;
    EXPECT_EQ(Translate(e, state)[0], Message(WM_SIZE, SIZE_RESTORED, MakeLong(1024, 768)));
    e.window.event = SDL_WINDOWEVENT_FOCUS_LOST;
    EXPECT_EQ(Translate(e, state)[0], Message(WM_ACTIVATEAPP, 0, 0));
    e.window.event = SDL_WINDOWEVENT_MOVED;
    e.window.data1 = 40;
    e.window.data2 = 30;
    EXPECT_EQ(Translate(e, state)[0], Message(WM_MOVE, 0, MakeLong(40, 30)));
    e.window.event = SDL_WINDOWEVENT_CLOSE;
    EXPECT_EQ(Translate(e, state)[0].message, WM_CLOSE);
    SDL_Event quit {};
    quit.type = SDL_QUIT;
    EXPECT_EQ(Translate(quit)[0].message, WM_CLOSE);

    // A full-screen window changes its size only with the desktop's mode.
    e.window.event = SDL_WINDOWEVENT_SIZE_CHANGED;
    e.window.data1 = 1280;
    e.window.data2 = 1024;
    EXPECT_EQ(Translate(e, state).size(), 1u);
    state.fullscreen = true;
    auto resized = Translate(e, state);
    ASSERT_EQ(resized.size(), 2u);
    EXPECT_EQ(resized[0], Message(WM_SIZE, SIZE_RESTORED, MakeLong(1280, 1024)));
    EXPECT_EQ(resized[1], Message(WM_DISPLAYCHANGE, 32, MakeLong(1280, 1024)));
    SDL_Event display {};
    display.type = SDL_DISPLAYEVENT;
    state.desktopWidth = 2560;
    state.desktopHeight = 1440;
    EXPECT_EQ(Translate(display, state)[0], Message(WM_DISPLAYCHANGE, 32, MakeLong(2560, 1440)));
}

namespace {
struct RecordingClient : IPlatformClient {
    CSystemIntegration* adapter = nullptr;
    std::vector<uint32_t> messages;
    void ProcessEvent() override { messages.push_back(adapter->GetCurrentEvent()->message); }
    void Update() override {}
    void Draw() override {}
};
} // namespace

TEST(SdlAdapter, SecondInstanceIsRefusedAndNotifiesTheFirst)
{
    oxtest::TempDir dir;
    CStandaloneApplicationSdl first(false);
    RecordingClient client;
    client.adapter = &first;
    first.SetClient(&client);
    first.SetIdentity("DemoProduct", "Demo", dir.Path().string());
    ASSERT_TRUE(first.CheckSingleInstance());
    ASSERT_TRUE(first.Init()) << SDL_GetError();
    ASSERT_TRUE(first.SetScreenMode(false, true, 320, 240));
    EXPECT_EQ(first.GetClientRect().Width, 320);

    {
        CStandaloneApplicationSdl second(false);
        second.SetIdentity("DemoProduct", "Demo", dir.Path().string());
        EXPECT_FALSE(second.CheckSingleInstance());
    }
    first.PumpMessages();
    EXPECT_NE(std::find(client.messages.begin(), client.messages.end(), WM_OX_NOTIFY), client.messages.end());

    CStandaloneApplicationSdl anonymous(false);
    EXPECT_TRUE(anonymous.CheckSingleInstance()) << "an empty product takes no lock";

    EXPECT_CONTRACT_FAILURE(first.SetCursorType(7, false), "type < 4");
    first.SetCursorType(CursorWait, true);
    EXPECT_EQ(first.GetCursorType(), 3u);
    first.ShowCursor(false);
    EXPECT_FALSE(first.IsCursorVisible());
    first.Shutdown();
    first.Shutdown();
}

TEST(SdlAdapter, NestedLoopsEndByStopNestedAndTheMainLoopByStopAlone)
{
    struct LoopClient : IPlatformClient {
        CStandaloneApplicationSdl* adapter = nullptr;
        int frames = 0;
        int nestedReturnedAt = 0;
        void ProcessEvent() override {}
        void Draw() override {}
        void Update() override
        {
            ++frames;
            if (frames == 1) {
                adapter->StopNested(); // no nested loop runs: the main loop goes on
            } else if (frames == 2) {
                adapter->RunNested();
                nestedReturnedAt = frames;
            } else if (frames == 4) {
                adapter->StopNested();
            } else if (frames == 6) {
                adapter->Stop();
            }
        }
    };
    CStandaloneApplicationSdl adapter(false);
    LoopClient client;
    client.adapter = &adapter;
    adapter.SetClient(&client);
    adapter.Run();
    EXPECT_EQ(client.nestedReturnedAt, 4);
    EXPECT_EQ(client.frames, 6);
}
