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

// Published values of FNV-1a; the sign of char must not leak into them.
TEST(Hashes, AreFowlerNollVo)
{
    EXPECT_EQ(Tstring("").hash(), 0x811c9dc5u);
    EXPECT_EQ(Tstring("a").hash(), 0xe40c292cu);
    EXPECT_EQ(Tstring("foobar").hash(), 0xbf9cf968u);
    EXPECT_EQ(TuniqueString("").hash(), 0xcbf29ce484222325u);
    EXPECT_EQ(TuniqueString("a").hash(), 0xaf63dc4c8601ec8cu);
    EXPECT_EQ(TuniqueString("foobar").hash(), 0x85944171f73967e8u);
    EXPECT_EQ(Tstring("\xff").hash(), (0x811c9dc5u ^ 0xffu) * 0x01000193u);
}

TEST(Hashes, OfPlugsTakeBothHalves)
{
    constexpr std::uint64_t side = 100;
    std::set<std::uint64_t> hashes;
    for (std::uint64_t node = 0; node < side; ++node) {
        for (std::uint64_t attribute = 0; attribute < side; ++attribute) {
            hashes.insert(Tplug(node, attribute).hash());
        }
    }
    EXPECT_EQ(hashes.size(), side * side);
    EXPECT_EQ(Tplug(3, 4).hash(), Tplug(3, 4).hash());
    EXPECT_EQ(Tplug::fsNULL, Tplug());
    EXPECT_FALSE(Tplug(0, 1) == Tplug::fsNULL);
}

TEST(String, CutsAndExtendsWithNulBytes)
{
    Tstring text("abc");
    text.setLength(5);
    ASSERT_EQ(text.length(), 5u);
    EXPECT_EQ(std::string_view(text.asChar(), 6), std::string_view("abc\0\0\0", 6));
    text.setLength(2);
    EXPECT_STREQ(text.asChar(), "ab");

    // A byte string: what stands behind a NUL counts.
    Tstring other("ab");
    other.setLength(3);
    EXPECT_FALSE(text == other);
    EXPECT_NE(text.hash(), other.hash());

    EXPECT_EQ(Tstring(nullptr).length(), 0u);
}

TEST(String, Appends)
{
    Tstring text("a");
    text += "b";
    text += Tstring("cd");
    text += static_cast<const char*>(nullptr);
    EXPECT_STREQ(text.asChar(), "abcd");
    std::memcpy(text.data() + 1, "XY", 2);
    EXPECT_EQ(text, Tstring("aXYd"));
}

TEST(String, FindsTextsAndCharacters)
{
    const Tstring text("one two one \xc3\xa9 \xf0\x9f\x98\x80");
    EXPECT_EQ(text.findMB("one"), 0);
    EXPECT_EQ(text.findMB("one", 1), 8);
    EXPECT_EQ(text.findMB("one", 8), 8);
    EXPECT_EQ(text.findMB("one", 9), -1);
    EXPECT_EQ(text.findMB("one", -5), 0);
    EXPECT_EQ(text.findMB("one", 1000), -1);
    EXPECT_EQ(text.findMB("three"), -1);
    EXPECT_EQ(text.findMB(static_cast<const char*>(nullptr)), -1);
    EXPECT_EQ(text.findMB(L' '), 3);
    EXPECT_EQ(text.findMB(L' ', 4), 7);
    EXPECT_EQ(text.findMB(L'\t'), -1);
    EXPECT_EQ(text.findMB(L'\u00e9'), 12);
    EXPECT_EQ(text.findMB(static_cast<wchar_t>(0x1f600)), 15);
    EXPECT_EQ(text.findMB(static_cast<wchar_t>(0xd83d)), -1) << "half of a surrogate pair";
}

TEST(String, TrimsSpacesOnlyAndOnlyOutside)
{
    const std::pair<const char*, const char*> rows[] = {
        {"  a b  ", "a b"}, {"a", "a"}, {"   ", ""}, {"", ""}, {" \ta\n ", "\ta\n"}};
    for (const auto& [before, after] : rows) {
        Tstring text(before);
        text.removeInitialAndFinalSpaces();
        EXPECT_STREQ(text.asChar(), after);
    }
}

// Interns all texts, beginning at another one than its neighbours do.
std::vector<TuniqueString> internAll(const std::vector<std::string>& texts, std::size_t first)
{
    std::vector<TuniqueString> handles(texts.size());
    for (std::size_t i = 0; i < texts.size(); ++i) {
        const std::size_t at = (first + i) % texts.size();
        handles[at] = TuniqueString(texts[at].c_str());
    }
    return handles;
}

TEST(UniqueString, GivesAllThreadsOneHandleForOneText)
{
    constexpr std::size_t threadCount = 8;
    // More than the table has buckets, so that some texts meet in one.
    std::vector<std::string> texts(40'000);
    for (std::size_t i = 0; i < texts.size(); ++i) {
        texts[i] = "node" + std::to_string(i) + ".attribute";
    }

    std::vector<std::vector<TuniqueString>> handles(threadCount);
    {
        std::vector<std::jthread> threads;
        for (std::size_t i = 0; i < threadCount; ++i) {
            // Pairs of threads walk the same way and meet at each text.
            threads.emplace_back([&, i] { handles[i] = internAll(texts, i / 2 * 100); });
        }
    }

    std::set<const char*> addresses;
    for (std::size_t text = 0; text < texts.size(); ++text) {
        ASSERT_EQ(handles[0][text].asChar(), texts[text]);
        addresses.insert(handles[0][text].asChar());
    }
    EXPECT_EQ(addresses.size(), texts.size());
    for (std::size_t i = 1; i < threadCount; ++i) {
        EXPECT_EQ(handles[i], handles[0]) << "thread " << i;
    }
}

TEST(UniqueString, KeepsTextsOfEqualHashApart)
{
    const TuniqueString one("8yn0iYCKYHlIj4-BwPqk");
    const TuniqueString other("GReLUrM4wMqfg9yzV3KQ");
    ASSERT_EQ(one.hash(), other.hash());
    EXPECT_FALSE(one == other);
    EXPECT_STREQ(other.asChar(), "GReLUrM4wMqfg9yzV3KQ");
}

TEST(UniqueString, ReadsNullAsTheEmptyText)
{
    EXPECT_EQ(TuniqueString(nullptr), TuniqueString(""));
    EXPECT_STREQ(TuniqueString().asChar(), "");
    EXPECT_FALSE(TuniqueString("a") == TuniqueString("b"));
}

} // namespace
