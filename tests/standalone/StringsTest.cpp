#include "host/Tplug.h"
#include "host/Tstring.h"
#include "host/TuniqueString.h"

#include <gtest/gtest.h>

#include <cstring>
#include <set>
#include <string>
#include <string_view>
#include <thread>
#include <utility>
#include <vector>

namespace {

// Published values of FNV-1a; they do not depend on the sign of char.
TEST(Hashes, EqualFnv1a)
{
    EXPECT_EQ(Tstring("").hash(), 0x811c9dc5u);
    EXPECT_EQ(Tstring("foobar").hash(), 0xbf9cf968u);
    EXPECT_EQ(TuniqueString("").hash(), 0xcbf29ce484222325u);
    EXPECT_EQ(TuniqueString("foobar").hash(), 0x85944171f73967e8u);
    EXPECT_EQ(Tstring("\xff").hash(), (0x811c9dc5u ^ 0xffu) * 0x01000193u);
}

TEST(Hashes, PlugHashDependsOnBothHalves)
{
    constexpr std::uint64_t side = 100;
    std::set<std::uint64_t> hashes;
    for (std::uint64_t plug = 0; plug < side * side; ++plug)
        hashes.insert(Tplug(plug / side, plug % side).hash());
    EXPECT_EQ(hashes.size(), side * side);
    EXPECT_EQ(Tplug::fsNULL, Tplug());
    EXPECT_FALSE(Tplug(0, 1) == Tplug::fsNULL);
}

TEST(String, ResizeCutsOrExtendsWithNulBytesAndAppendAppends)
{
    Tstring text("abc");
    text.setLength(5);
    ASSERT_EQ(text.length(), 5u);
    EXPECT_EQ(std::string_view(text.asChar(), 6), std::string_view("abc\0\0\0", 6));
    // A byte string: bytes after a NUL are part of it.
    EXPECT_FALSE(text == Tstring("abc"));
    EXPECT_NE(text.hash(), Tstring("abc").hash());
    text.setLength(1);
    EXPECT_STREQ(text.asChar(), "a");

    text += "b";
    text += Tstring("cd");
    text += static_cast<const char*>(nullptr);
    EXPECT_STREQ(text.asChar(), "abcd");
    std::memcpy(text.data() + 1, "XY", 2);
    EXPECT_EQ(text, Tstring("aXYd"));
    EXPECT_EQ(Tstring(nullptr).length(), 0u);
}

TEST(String, FindsTextsAndCharacters)
{
    const Tstring text("one two one \xc3\xa9 \xe2\x82\xac \xed\xa0\xbd");
    for (const auto& [from, found] : {std::pair(0, 0), {1, 8}, {8, 8}, {9, -1}, {-5, 0}, {99, -1}})
        EXPECT_EQ(text.findMB("one", from), found) << from;
    EXPECT_EQ(text.findMB("three"), -1);
    EXPECT_EQ(text.findMB(static_cast<const char*>(nullptr)), -1);

    EXPECT_EQ(text.findMB(L' ', 4), 7);
    // The last is half of a surrogate pair, which has no bytes.
    for (const auto& [code, found] :
         {std::pair(L' ', 3), {L'\t', -1}, {L'\u00e9', 12}, {L'\u20ac', 15}, {wchar_t{0xd83d}, -1}})
        EXPECT_EQ(text.findMB(code), found) << int{code};
    if (sizeof(wchar_t) > 2) {
        EXPECT_EQ(Tstring("a\xf0\x9f\x98\x80").findMB(static_cast<wchar_t>(0x1f600)), 1);
    }
}

TEST(String, TrimsSpacesOnlyAndOnlyOutside)
{
    for (const auto& [before, after] :
         {std::pair("  a b  ", "a b"), {"a", "a"}, {"   ", ""}, {"", ""}, {" \ta\n ", "\ta\n"}}) {
        Tstring text(before);
        text.removeInitialAndFinalSpaces();
        EXPECT_STREQ(text.asChar(), after);
    }
}

TEST(UniqueString, EqualTextsHaveOneHandleOnAllThreads)
{
    constexpr std::size_t threadCount = 8;
    // More than the table has buckets, so that some texts share one.
    std::vector<std::string> texts(40'000);
    for (std::size_t i = 0; i < texts.size(); ++i)
        texts[i] = "node" + std::to_string(i) + ".attribute";

    std::vector handles(threadCount, std::vector<TuniqueString>(texts.size()));
    std::vector<std::jthread> threads;
    for (std::size_t thread = 0; thread < threadCount; ++thread) {
        threads.emplace_back([&, thread] {
            for (std::size_t i = 0; i < texts.size(); ++i) {
                // Pairs of threads use the same order, so that both intern each text at once.
                const std::size_t at = (thread / 2 * 100 + i) % texts.size();
                handles[thread][at] = TuniqueString(texts[at].c_str());
            }
        });
    }
    threads.clear();
    for (std::size_t text = 0; text < texts.size(); ++text)
        ASSERT_EQ(handles[0][text].asChar(), texts[text]);
    EXPECT_EQ(handles, std::vector(threadCount, handles[0]));
}

TEST(UniqueString, DifferentTextsDifferEvenWithEqualHash)
{
    const TuniqueString one("8yn0iYCKYHlIj4-BwPqk");
    const TuniqueString other("GReLUrM4wMqfg9yzV3KQ");
    ASSERT_EQ(one.hash(), other.hash());
    EXPECT_FALSE(one == other);
    EXPECT_STREQ(other.asChar(), "GReLUrM4wMqfg9yzV3KQ");
    EXPECT_EQ(TuniqueString(nullptr), TuniqueString(""));
    EXPECT_STREQ(TuniqueString().asChar(), "");
}

} // namespace
