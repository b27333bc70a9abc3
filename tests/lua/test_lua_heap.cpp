// The Lua arena: bins, splits, coalescing, reallocation and exhaustion, each on an arena of
// its own that gives null when it runs out.
#include "lua/LuaHeap.h"

#include <gtest/gtest.h>

#include <lua.hpp>

#include <cstring>

using ox::lua::CLuaHeap;

namespace {

constexpr size_t H = CLuaHeap::HeaderSize;

uint8_t* Bytes(void* p) { return static_cast<uint8_t*>(p); }

// An arena whose one free block has exactly `free_size` bytes.
CLuaHeap ArenaWithFreeBlock(size_t free_size) { return CLuaHeap(free_size + 2 * H); }

} // namespace

TEST(LuaHeap, BlocksSplitFromOneArenaWithRealHeaders)
{
    EXPECT_EQ(H, 24u);
    CLuaHeap heap(4096);
    EXPECT_EQ(heap.FreeBlockCount(), 1u);
    void* a = heap.Allocate(100);
    void* b = heap.Allocate(1);
    ASSERT_TRUE(a && b);
    EXPECT_EQ(CLuaHeap::BlockSize(a), 104u);
    EXPECT_EQ(CLuaHeap::BlockSize(b), 8u);
    EXPECT_EQ(Bytes(b), Bytes(a) + 104 + H);
    EXPECT_EQ(heap.GetUsed(), 104 + 8 + 2 * H);
    // The first block held all but two headers.
    EXPECT_NE(heap.Allocate(4096 - 2 * H - 104 - 8 - 2 * H), nullptr);
    EXPECT_EQ(heap.GetUsed(), 4096 - H);
    EXPECT_EQ(heap.Allocate(8), nullptr);
    EXPECT_TRUE(heap.Check());
}

TEST(LuaHeap, BinsGiveExactAndNearBlocksWhole)
{
    CLuaHeap heap(64 * 1024);
    void* a64 = heap.Allocate(64);
    void* guard1 = heap.Allocate(8);
    void* a88 = heap.Allocate(88);
    void* guard2 = heap.Allocate(8);
    ASSERT_TRUE(a64 && guard1 && a88 && guard2);
    heap.Free(a64);
    heap.Free(a88);

    // The exact bin first.
    EXPECT_EQ(heap.Allocate(64), a64);
    // 88 bytes is three bins above 64: taken whole, not split.
    void* near = heap.Allocate(64);
    EXPECT_EQ(near, a88);
    EXPECT_EQ(CLuaHeap::BlockSize(near), 88u);
    heap.Free(near);
    // Four bins above 56 is too far: the request comes from the large tail instead.
    void* far = heap.Allocate(56);
    EXPECT_NE(far, a88);
    EXPECT_EQ(CLuaHeap::BlockSize(far), 56u);
    EXPECT_TRUE(heap.Check());
}

TEST(LuaHeap, SmallBinsAreSplitOnlyWithRoomForAHeader)
{
    {
        // No large block: bins from i+3 upwards are searched; size + header + 8 fits, so
        // the block is split, leaving an 8-byte block.
        CLuaHeap heap = ArenaWithFreeBlock(56 + H + 8);
        void* p = heap.Allocate(56);
        EXPECT_EQ(CLuaHeap::BlockSize(p), 56u);
        void* rest = heap.Allocate(8);
        ASSERT_NE(rest, nullptr);
        EXPECT_EQ(Bytes(rest), Bytes(p) + 56 + H);
    }
    {
        // One byte-step less: the block goes whole.
        CLuaHeap heap = ArenaWithFreeBlock(56 + H);
        void* p = heap.Allocate(56);
        EXPECT_EQ(CLuaHeap::BlockSize(p), 56u + H);
        EXPECT_EQ(heap.FreeBlockCount(), 0u);
        EXPECT_EQ(heap.Allocate(8), nullptr);
        EXPECT_TRUE(heap.Check());
    }
}

TEST(LuaHeap, LargeListIsFirstFitFromTheMostRecentlyFreed)
{
    CLuaHeap heap(3 * 2048 + 8 * H);
    void* a = heap.Allocate(2048);
    void* g1 = heap.Allocate(8);
    void* b = heap.Allocate(1504);
    void* g2 = heap.Allocate(8);
    ASSERT_TRUE(a && g1 && b && g2);
    // Whatever is left of the tail must not be large enough to compete.
    void* tail = heap.Allocate(3 * 2048 + 8 * H - 2048 - 1504 - 16 - 6 * H);
    ASSERT_NE(tail, nullptr);
    heap.Free(a);
    heap.Free(b); // head of the large list now
    void* p = heap.Allocate(1400);
    EXPECT_EQ(p, b);
    EXPECT_EQ(CLuaHeap::BlockSize(p), 1400u);
    // The rest of b (64 bytes) went to its bin; a is still whole for a request that fits.
    EXPECT_EQ(heap.Allocate(1600), a);
    EXPECT_TRUE(heap.Check());
}

TEST(LuaHeap, FreeJoinsWithBothNeighbours)
{
    CLuaHeap heap(64 * 1024);
    void* a = heap.Allocate(64);
    void* b = heap.Allocate(64);
    void* c = heap.Allocate(64);
    void* guard = heap.Allocate(8);
    ASSERT_TRUE(a && b && c && guard);
    size_t free_before = heap.FreeBlockCount();

    heap.Free(a);
    heap.Free(c);
    EXPECT_EQ(heap.FreeBlockCount(), free_before + 2);
    // b joins a before it and c after it.
    heap.Free(b);
    EXPECT_EQ(heap.FreeBlockCount(), free_before + 1);
    EXPECT_TRUE(heap.Check());
    void* joined = heap.Allocate(3 * 64 + 2 * H);
    EXPECT_EQ(joined, a);
    EXPECT_EQ(CLuaHeap::BlockSize(joined), 3 * 64 + 2 * H);

    // Freeing everything gives back one block over the whole arena.
    heap.Free(joined);
    heap.Free(guard);
    EXPECT_EQ(heap.FreeBlockCount(), 1u);
    EXPECT_EQ(heap.GetUsed(), 0u);
    EXPECT_NE(heap.Allocate(64 * 1024 - 2 * H), nullptr);
}

TEST(LuaHeap, ReallocateKeepsCloseFitsAndMovesContents)
{
    CLuaHeap heap(64 * 1024);
    EXPECT_EQ(heap.Reallocate(nullptr, 0), nullptr);
    auto* p = static_cast<char*>(heap.Reallocate(nullptr, 800));
    ASSERT_NE(p, nullptr);
    std::memset(p, 'x', 800);
    // A surplus below an eighth of the block keeps it.
    EXPECT_EQ(heap.Reallocate(p, 712), p);
    EXPECT_EQ(heap.Reallocate(p, 705), p);
    // An eighth or more moves the contents to a smaller block.
    auto* q = static_cast<char*>(heap.Reallocate(p, 696));
    ASSERT_NE(q, p);
    EXPECT_EQ(CLuaHeap::BlockSize(q), 696u);
    EXPECT_EQ(std::string(q, 696), std::string(696, 'x'));
    auto* r = static_cast<char*>(heap.Reallocate(q, 5000));
    ASSERT_NE(r, nullptr);
    EXPECT_EQ(std::string(r, 696), std::string(696, 'x'));
    EXPECT_EQ(heap.Reallocate(r, 0), nullptr);
    EXPECT_EQ(heap.GetUsed(), 0u);
    EXPECT_TRUE(heap.Check());
}

TEST(LuaHeap, ExhaustedArenaGivesNullAndStaysWhole)
{
    CLuaHeap heap(2048);
    void* p = heap.Allocate(1000);
    ASSERT_NE(p, nullptr);
    std::memset(p, 7, 1000);
    EXPECT_EQ(heap.Allocate(2048), nullptr);
    EXPECT_EQ(heap.Allocate(size_t(-1)), nullptr);
    // Growing fails and leaves the block; shrinking never fails.
    EXPECT_EQ(heap.Reallocate(p, 1500), nullptr);
    EXPECT_EQ(static_cast<uint8_t*>(p)[999], 7);
    void* filler = heap.Allocate(2048 - 1000 - 3 * H);
    ASSERT_NE(filler, nullptr);
    EXPECT_EQ(heap.Reallocate(p, 500), p);
    EXPECT_TRUE(heap.Check());
}

TEST(LuaHeap, LuaStateOnASmallArena)
{
    CLuaHeap heap(1024 * 1024);
    lua_State* L = lua_newstate(&CLuaHeap::LuaAlloc, &heap);
    ASSERT_NE(L, nullptr);
    luaL_openlibs(L);
    const char* churn = "for round = 1, 20 do local t = {} for i = 1, 300 do t[i] = {i, tostring(i)} end end "
                        "collectgarbage()";
    ASSERT_EQ(luaL_dostring(L, churn), 0) << lua_tostring(L, -1);
    EXPECT_TRUE(heap.Check());
    // Running out is a Lua memory error inside the protected call, not the end of the process.
    const char* hog = "local t = {} for i = 1, 1e7 do t[i] = string.rep('x', 64) .. i end";
    EXPECT_EQ(luaL_loadstring(L, hog), 0);
    EXPECT_EQ(lua_pcall(L, 0, 0, 0), LUA_ERRMEM);
    lua_pop(L, 1);
    lua_gc(L, LUA_GCCOLLECT, 0);
    EXPECT_TRUE(heap.Check());
    EXPECT_EQ(luaL_dostring(L, "return 1 + 1"), 0);
    lua_close(L);
    EXPECT_EQ(heap.GetUsed(), 0u);
    EXPECT_TRUE(heap.Check());
}

TEST(LuaHeap, SmallTablesFillTheArenaAtTwentyFourBytesABlock)
{
    // Each link of the chain is a table (64 bytes on 64-bit) with an array part of one
    // value (16 bytes): two blocks of 80 payload bytes and two 24-byte headers.
    constexpr size_t arena = 2 * 1024 * 1024;
    constexpr size_t perTable = 64 + 16 + 2 * 24;
    CLuaHeap heap(arena);
    lua_State* L = lua_newstate(&CLuaHeap::LuaAlloc, &heap);
    ASSERT_NE(L, nullptr);
    ASSERT_EQ(luaL_loadstring(L, "local chain chain = {chain} count = 0 while true do chain = {chain} count = count + 1 end"),
              0);
    size_t before = heap.GetUsed();
    EXPECT_EQ(lua_pcall(L, 0, 0, 0), LUA_ERRMEM);
    lua_getglobal(L, "count");
    double count = lua_tonumber(L, -1);
    double expected = double(arena - before) / perTable;
    EXPECT_NEAR(count, expected, expected / 100);
    lua_close(L);
    EXPECT_EQ(heap.GetUsed(), 0u);
}

TEST(LuaHeapDeathTest, ExhaustionStopsTheProcessWithTheBytesInUse)
{
    CLuaHeap heap(4096, CLuaHeap::Exhaustion::StopProcess);
    ASSERT_NE(heap.Allocate(1000), nullptr);
    EXPECT_DEATH(heap.Allocate(8000), "Lua heap exhausted: 8000 bytes requested, 1024 of 4096 bytes in use");
}
