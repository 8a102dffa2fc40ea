#include <array>
#include <climits>
#include <cstring>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <vornplatform/core.h>

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

/** A list that frees itself. */
class List {
public:
    explicit List(int size) : m_list(VLIBCSzListAlloc(size)) {}
    List(const List&) = delete;
    List& operator=(const List&) = delete;
    ~List() { VLIBCSzListFree(m_list); }
    VLIBCSzList*& Get() { return m_list; }

    std::vector<std::string> Items()
    {
        std::vector<std::string> items;
        items.reserve(static_cast<size_t>(m_list->nItem));
        for (int index = 0; index < m_list->nItem; ++index) {
            items.emplace_back(VLIBCSzListGet(m_list, index));
        }
        return items;
    }

private:
    VLIBCSzList* m_list;
};

TEST(StringList, BeginsEmptyAndWithItsCount)
{
    List list(512);
    ASSERT_NE(list.Get(), nullptr);
    int count = -1;
    std::memcpy(&count, list.Get(), sizeof count);
    EXPECT_EQ(count, 0);
    EXPECT_EQ(VLIBCSzListGet(list.Get(), 0), nullptr);
}

TEST(StringList, TakesPiecesOfATextBehindThoseThatItHas)
{
    List list(512);
    EXPECT_GE(VLIBCStrSep("eth0 eth1", " ", &list.Get()), 0);
    EXPECT_GE(VLIBCStrSep("eth2", " ", &list.Get()), 0);
    EXPECT_THAT(list.Items(), ElementsAre("eth0", "eth1", "eth2"));
    EXPECT_EQ(VLIBCSzListGet(list.Get(), 3), nullptr);
    EXPECT_EQ(VLIBCSzListGet(list.Get(), -1), nullptr);
}

TEST(StringList, TakesNoEmptyPieces)
{
    List list(0);
    EXPECT_GE(VLIBCStrSep("  eth0   eth1 ", " ", &list.Get()), 0);
    EXPECT_GE(VLIBCStrSep("", " ", &list.Get()), 0);
    EXPECT_GE(VLIBCStrSep("   ", " ", &list.Get()), 0);
    EXPECT_THAT(list.Items(), ElementsAre("eth0", "eth1"));
}

TEST(StringList, TakesAWholeTextWithoutASeparatorInIt)
{
    List list(1);
    EXPECT_GE(VLIBCStrSep("eth0 eth1", "", &list.Get()), 0);
    EXPECT_GE(VLIBCStrSep("a,b;c", ",;", &list.Get()), 0);
    EXPECT_THAT(list.Items(), ElementsAre("eth0 eth1", "a", "b", "c"));
}

TEST(StringList, GrowsPastItsSize)
{
    List list(1);
    std::string text;
    for (int index = 0; index < 5000; ++index) {
        text += "eth" + std::to_string(index) + " ";
    }
    EXPECT_GE(VLIBCStrSep(text.c_str(), " ", &list.Get()), 0);
    EXPECT_EQ(list.Get()->nItem, 5000);
    EXPECT_STREQ(VLIBCSzListGet(list.Get(), 4999), "eth4999");
}

TEST(StringList, SurvivesSenselessArguments)
{
    List list(-1);
    List large(INT_MAX);
    ASSERT_NE(list.Get(), nullptr);
    ASSERT_NE(large.Get(), nullptr);
    VLIBCSzList* none = nullptr;
    EXPECT_LT(VLIBCStrSep(nullptr, " ", &list.Get()), 0);
    EXPECT_LT(VLIBCStrSep("a", nullptr, &list.Get()), 0);
    EXPECT_LT(VLIBCStrSep("a", " ", nullptr), 0);
    EXPECT_LT(VLIBCStrSep("a", " ", &none), 0);
    EXPECT_EQ(VLIBCSzListGet(nullptr, 0), nullptr);
    VLIBCSzListFree(nullptr);
    EXPECT_THAT(list.Items(), IsEmpty());
}

TEST(StringHash, SurvivesSenselessArguments)
{
    VLIBCSzHash* hash = VLIBCSzHashAlloc(INT_MAX);
    ASSERT_NE(hash, nullptr);
    VLIBCSzHash* none = nullptr;
    EXPECT_GE(VLIBCSzHashSetValue(&hash, "key", "value"), 0);
    EXPECT_LT(VLIBCSzHashSetValue(&hash, nullptr, "value"), 0);
    EXPECT_LT(VLIBCSzHashSetValue(&hash, "key", nullptr), 0);
    EXPECT_LT(VLIBCSzHashSetValue(&none, "key", "value"), 0);
    EXPECT_LT(VLIBCSzHashSetValue(nullptr, "key", "value"), 0);
    VLIBCSzHashFree(hash);
    VLIBCSzHashFree(nullptr);
}

TEST(TrimSpace, TakesWhiteSpaceFromBothEnds)
{
    std::array<char, 1024> destination{};
    const std::vector<std::pair<const char*, const char*>> rows = {
        {" \t eth0 eth1 \n", "eth0 eth1"}, {"eth0", "eth0"}, {"", ""}, {" \t\r\n\v\f", ""}};
    for (const auto& [source, expected] : rows) {
        EXPECT_EQ(VLIBCStrTrimSpace(source, destination.data()), 0);
        EXPECT_STREQ(destination.data(), expected);
    }
}

TEST(TrimSpace, WritesNoMoreThanTheDestinationHolds)
{
    std::array<char, 1025> destination{};
    destination.fill('#');
    EXPECT_EQ(VLIBCStrTrimSpace(("  " + std::string(1023, 'x') + "  ").c_str(), destination.data()),
              0);
    EXPECT_EQ(destination.data(), std::string(1023, 'x'));
    EXPECT_LT(VLIBCStrTrimSpace(std::string(1024, 'y').c_str(), destination.data()), 0);
    EXPECT_STREQ(destination.data(), "") << "and the beginning of a list is not the list";
    EXPECT_EQ(destination[1024], '#');
}

TEST(TrimSpace, TrimsABufferInItsPlace)
{
    std::array<char, 1024> text{"  eth0 "};
    EXPECT_EQ(VLIBCStrTrimSpace(text.data(), text.data()), 0);
    EXPECT_STREQ(text.data(), "eth0");
    EXPECT_LT(VLIBCStrTrimSpace(nullptr, text.data()), 0);
    EXPECT_LT(VLIBCStrTrimSpace("x", nullptr), 0);
}

} // namespace
