#include "scene.h"

#include "support/keyvaluefile.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <initializer_list>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sys/stat.h>
#include <unistd.h>
#include <vornplatform/core.h>

namespace {

using scene::ReadFile;
using scene::WriteFile;
using testing::ElementsAre;
using vornhost::KeyValueFile;

constexpr char kFolder[] = "/etc/sysconfig/network-scripts";
constexpr char kPath[] = "/etc/sysconfig/network-scripts/ifcfg-eth0";
constexpr char kFormat[] = "%s=%s\n";

/** A pair for a hash; a null value cannot be put there. */
struct Entry {
    const char* key;
    const char* value;
};

/** A hash that frees itself. */
class Hash {
public:
    explicit Hash(std::initializer_list<Entry> entries) : m_hash(VLIBCSzHashAlloc(1024))
    {
        for (const Entry& entry : entries) {
            (void)VLIBCSzHashSetValue(&m_hash, entry.key, entry.value);
        }
    }
    Hash(const Hash&) = delete;
    Hash& operator=(const Hash&) = delete;
    ~Hash() { VLIBCSzHashFree(m_hash); }
    VLIBCSzHash* Get() const { return m_hash; }

private:
    VLIBCSzHash* m_hash;
};

class KeyValue : public testing::Test {
protected:
    void SetUp() override
    {
        scene::MakeFolder(kFolder);
        (void)::unlink(kPath);
    }

    static std::string Value(const char* key)
    {
        std::array<char, 1024> value{};
        return VLIBCFileGetKeyValue(kPath, key, value.data(), 1024, 0) < 0 ? "(failed)"
                                                                           : value.data();
    }
};

TEST_F(KeyValue, IsReadVerbatim)
{
    WriteFile(kPath, "DEVICE=eth0\nEMPTY=\nURL=a=b=c\nBLANKS= a b \n  INDENTED=yes\nLAST=end");
    EXPECT_EQ(Value("DEVICE"), "eth0");
    EXPECT_EQ(Value("EMPTY"), "");
    EXPECT_EQ(Value("URL"), "a=b=c");
    EXPECT_EQ(Value("BLANKS"), " a b ");
    EXPECT_EQ(Value("INDENTED"), "yes");
    EXPECT_EQ(Value("LAST"), "end");
}

TEST_F(KeyValue, IsReadWithoutItsDoubleQuotes)
{
    WriteFile(kPath, "SLAVE_LIST=\"eth0 eth1 \"\nEMPTY=\"\"\nONE=\"\nOPEN=\"a\nINNER=a\"b\"c\n"
                     "SINGLE='a'\nTRAILING=\"a\"  \nNESTED=\"\"a\"\"\n");
    EXPECT_EQ(Value("SLAVE_LIST"), "eth0 eth1 ");
    EXPECT_EQ(Value("EMPTY"), "");
    EXPECT_EQ(Value("ONE"), "\"");
    EXPECT_EQ(Value("OPEN"), "\"a");
    EXPECT_EQ(Value("INNER"), "a\"b\"c");
    EXPECT_EQ(Value("SINGLE"), "'a'");
    EXPECT_EQ(Value("TRAILING"), "a");
    EXPECT_EQ(Value("NESTED"), "\"a\"");
}

TEST_F(KeyValue, IsNotFoundInACommentOrInAnotherKey)
{
    WriteFile(kPath, "# MTU=1\n#MTU=2\n  #MTU=3\nXMTU=4\nMTUX=5\nMTU =6\nMTU\nX=MTU=7\n");
    EXPECT_EQ(Value("MTU"), "(failed)");
    EXPECT_EQ(Value(""), "(failed)");
    EXPECT_EQ(Value("X"), "MTU=7");
}

TEST_F(KeyValue, OfALineWithACarriageReturnIsReadWithoutIt)
{
    WriteFile(kPath, "A=1\r\nB=\"2\"\r\nC=3");
    EXPECT_EQ(Value("A"), "1");
    EXPECT_EQ(Value("B"), "2");
}

TEST_F(KeyValue, ThatIsRepeatedIsReadAsAShellDoes)
{
    WriteFile(kPath, "A=first\nB=\nA=last\n");
    EXPECT_EQ(Value("A"), "last");
}

TEST_F(KeyValue, IsNotReadFromWhatIsNoFile)
{
    EXPECT_EQ(Value("A"), "(failed)");
    ASSERT_EQ(::mkfifo(kPath, 0600), 0);
    EXPECT_EQ(Value("A"), "(failed)") << "and it does not wait for a writer";
    EXPECT_LT(VLIBCFileSetKeyValue(kPath, "A", "1", 0), 0);
    std::array<char, 8> value{};
    EXPECT_LT(VLIBCFileGetKeyValue("/etc/sysconfig", "A", value.data(), 8, 0), 0);
}

TEST_F(KeyValue, ThatDoesNotFitIsAFailureAndNotCut)
{
    WriteFile(kPath, "A=123456\nB=1234567\n");
    std::array<char, 8> value{'x', '\0'};
    EXPECT_LT(VLIBCFileGetKeyValue(kPath, "B", value.data(), 7, 0), 0);
    EXPECT_STREQ(value.data(), "x") << "and leaves the buffer alone";
    EXPECT_EQ(VLIBCFileGetKeyValue(kPath, "A", value.data(), 7, 0), 0);
    EXPECT_STREQ(value.data(), "123456");
    EXPECT_LT(VLIBCFileGetKeyValue(kPath, "A", value.data(), 0, 0), 0);
    EXPECT_LT(VLIBCFileGetKeyValue(kPath, "A", value.data(), -1, 0), 0);
    EXPECT_LT(VLIBCFileGetKeyValue(kPath, "A", nullptr, 8, 0), 0);
    EXPECT_LT(VLIBCFileGetKeyValue(nullptr, "A", value.data(), 8, 0), 0);
    EXPECT_LT(VLIBCFileGetKeyValue(kPath, nullptr, value.data(), 8, 0), 0);
}

TEST_F(KeyValue, IsComparedExactly)
{
    WriteFile(kPath, "net_topology=\"bridge\"\nother=bridged\n");
    EXPECT_EQ(VLIBCFileCheckKeyValue(kPath, "net_topology", "bridge", 0), 1);
    EXPECT_NE(VLIBCFileCheckKeyValue(kPath, "net_topology", "bridg", 0), 1);
    EXPECT_NE(VLIBCFileCheckKeyValue(kPath, "other", "bridge", 0), 1);
    EXPECT_NE(VLIBCFileCheckKeyValue(kPath, "missing", "", 0), 1);
    EXPECT_NE(VLIBCFileCheckKeyValue("/etc/vorninfo.conf", "net_topology", "bridge", 0), 1);
    EXPECT_NE(VLIBCFileCheckKeyValue(nullptr, nullptr, nullptr, 0), 1);
}

/** An edit of a text, and what becomes of it. */
struct TextEdit {
    const char* name;
    std::string before;
    std::string after;
};

class SetKeyValue : public testing::TestWithParam<TextEdit> {};

TEST_P(SetKeyValue, ChangesNothingElse)
{
    scene::MakeFolder(kFolder);
    WriteFile(kPath, GetParam().before);
    EXPECT_EQ(VLIBCFileSetKeyValue(kPath, "KEY", "new", 0), 0);
    EXPECT_EQ(ReadFile(kPath), GetParam().after);
}

INSTANTIATE_TEST_SUITE_P(
    In, SetKeyValue,
    testing::Values(
        TextEdit{"AnEmptyFile", "", "KEY=new\n"},
        TextEdit{"AFileWithTheKey", "A=1\nKEY=old\nB=2\n", "A=1\nKEY=new\nB=2\n"},
        TextEdit{"AFileWithoutTheKey", "A=1\n", "A=1\nKEY=new\n"},
        TextEdit{"AFileWithTheKeyRepeated", "KEY=1\nA=1\nKEY=2\n#c\nKEY=3\n", "KEY=new\nA=1\n#c\n"},
        TextEdit{"AFileWithTheKeyRepeatedAtItsOpenEnd", "KEY=1\nKEY=2", "KEY=new"},
        TextEdit{"AFileOfCommentsAndOddLines", "# KEY=1\n\n  \nnonsense\n=x\n\tKEY=1\n",
                 "# KEY=1\n\n  \nnonsense\n=x\nKEY=new\n"},
        TextEdit{"AFileWithoutALastLineBreak", "A=1", "A=1\nKEY=new"},
        TextEdit{"AFileWithTheKeyInAnOpenLastLine", "A=1\nKEY=old", "A=1\nKEY=new"},
        TextEdit{"AFileOfCarriageReturns", "A=1\r\nKEY=old\r\n", "A=1\r\nKEY=new\r\n"},
        TextEdit{"AFileOfCarriageReturnsWithoutTheKey", "A=1\r\n", "A=1\r\nKEY=new\r\n"},
        TextEdit{"AFileWithNulBytes", std::string("A=\0x\n\0\nKEY=old\n", 15),
                 std::string("A=\0x\n\0\nKEY=new\n", 15)},
        TextEdit{"AFileWithBytesThatAreNoText", "A=\xff\xfe\nKEY=\xe4\n", "A=\xff\xfe\nKEY=new\n"}),
    [](const auto& row) { return row.param.name; });

class RemoveKey : public testing::TestWithParam<TextEdit> {};

TEST_P(RemoveKey, ChangesNothingElse)
{
    scene::MakeFolder(kFolder);
    WriteFile(kPath, GetParam().before);
    EXPECT_EQ(VLIBCFileRemoveKey(kPath, "KEY"), 0);
    EXPECT_EQ(ReadFile(kPath), GetParam().after);
}

INSTANTIATE_TEST_SUITE_P(
    In, RemoveKey,
    testing::Values(TextEdit{"AFileWithTheKey", "A=1\nKEY=old\nB=2\n", "A=1\nB=2\n"},
                    TextEdit{"AFileWithTheKeyRepeated", "KEY=1\nA=1\nKEY=2\n", "A=1\n"},
                    TextEdit{"AFileOfThatKeyAlone", "KEY=1\n", ""},
                    TextEdit{"AFileOfThatKeyAloneWithoutALineBreak", "KEY=1", ""},
                    TextEdit{"AFileWithTheKeyInAnOpenLastLine", "A=1\nKEY=1", "A=1"},
                    TextEdit{"AFileWithAnEmptyLineBeforeThat", "A=1\n\nKEY=1", "A=1\n\n"},
                    TextEdit{"AFileOfCarriageReturns", "A=1\r\nKEY=1\r\n", "A=1\r\n"}),
    [](const auto& row) { return row.param.name; });

TEST_F(KeyValue, ThatIsSetAndRemovedLeavesEveryByteAsItWas)
{
    std::mt19937 random(20231);
    constexpr std::string_view kLetters("AB=#\" \t\r\n\0x", 11);
    for (int round = 0; round < 20000; ++round) {
        std::string text;
        for (size_t length = random() % 24; length > 0; --length) {
            text += kLetters[random() % kLetters.size()];
        }
        KeyValueFile file = KeyValueFile::Parse(text);
        const bool hadOther = file.Get("A").has_value();
        const std::string other = file.Get("A").value_or("");
        ASSERT_TRUE(file.Set("KEY", "value"));
        ASSERT_EQ(file.Get("KEY"), "value") << testing::PrintToString(text);
        ASSERT_EQ(file.Get("A").has_value(), hadOther) << testing::PrintToString(text);
        ASSERT_EQ(file.Get("A").value_or(""), other) << testing::PrintToString(text);
        ASSERT_TRUE(file.Set("KEY", "changed"));
        ASSERT_TRUE(file.Remove("KEY"));
        ASSERT_EQ(file.Text(), text) << testing::PrintToString(text);
    }
}

TEST_F(KeyValue, IsPresentOnceAfterItWasSetWhateverTheFileHolds)
{
    std::mt19937 random(7);
    constexpr std::string_view kLetters("KV==##\"\" \r\n\n\0", 13);
    for (int round = 0; round < 20000; ++round) {
        std::string text;
        for (size_t length = random() % 24; length > 0; --length) {
            text += kLetters[random() % kLetters.size()];
        }
        KeyValueFile file = KeyValueFile::Parse(text);
        ASSERT_TRUE(file.Set("K", "value"));
        ASSERT_EQ(file.Get("K"), "value") << testing::PrintToString(text);
        ASSERT_TRUE(file.Remove("K"));
        ASSERT_FALSE(file.Remove("K")) << testing::PrintToString(text);
    }
}

TEST_F(KeyValue, IsAddedToAFileThatIsMadeForIt)
{
    const mode_t mask = ::umask(077);
    EXPECT_EQ(VLIBCFileSetKeyValue(kPath, "DEVICE", "eth0", 0), 0);
    ::umask(mask);
    EXPECT_EQ(ReadFile(kPath), "DEVICE=eth0\n");
    struct stat status {};
    ASSERT_EQ(::stat(kPath, &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0644U);
}

TEST_F(KeyValue, ThatWouldBreakTheFileIsRefused)
{
    WriteFile(kPath, "A=1\n");
    for (const char* key : {"", "A=B", "A\nB", "A\rB", "#A", " A", "A B", "A\tB"}) {
        EXPECT_LT(VLIBCFileSetKeyValue(kPath, key, "x", 0), 0) << testing::PrintToString(key);
        EXPECT_LT(VLIBCFileRemoveKey(kPath, key), 0) << testing::PrintToString(key);
    }
    for (const char* value : {"x\nONBOOT=no", "x\r", "\n"}) {
        EXPECT_LT(VLIBCFileSetKeyValue(kPath, "B", value, 0), 0) << testing::PrintToString(value);
    }
    EXPECT_LT(VLIBCFileSetKeyValue(kPath, nullptr, "x", 0), 0);
    EXPECT_LT(VLIBCFileSetKeyValue(kPath, "B", nullptr, 0), 0);
    EXPECT_LT(VLIBCFileSetKeyValue(nullptr, "B", "x", 0), 0);
    EXPECT_LT(VLIBCFileRemoveKey(kPath, nullptr), 0);
    EXPECT_EQ(ReadFile(kPath), "A=1\n");
}

TEST_F(KeyValue, ThatIsNotThereIsRemovedWithoutTouchingTheFile)
{
    WriteFile(kPath, "A=1\n");
    struct stat before {};
    ASSERT_EQ(::stat(kPath, &before), 0);
    EXPECT_EQ(VLIBCFileRemoveKey(kPath, "B"), 0);
    EXPECT_EQ(VLIBCFileSetKeyValue(kPath, "A", "1", 0), 0);
    struct stat after {};
    ASSERT_EQ(::stat(kPath, &after), 0);
    EXPECT_EQ(before.st_ino, after.st_ino);
}

TEST_F(KeyValue, IsNotRemovedFromAMissingFile)
{
    EXPECT_LT(VLIBCFileRemoveKey(kPath, "A"), 0);
    EXPECT_FALSE(scene::Exists(kPath));
}

TEST_F(KeyValue, IsSetAndRemovedTogetherWithOthersInOneEdit)
{
    WriteFile(kPath, "# wired\nDEVICE=eth0\nSLAVE=yes\nBRIDGE=br0\nIPADDR=192.0.2.1\n");
    const Hash set({{"TYPE", "OVS"}, {"DEVICE", "ovs_eth0"}, {"PRIMARY", "eth0"}, {"IPADDR", ""}});
    const Hash remove({{"BRIDGE", ""}, {"SLAVE", ""}, {"BONDING_OPTS", ""}});
    EXPECT_EQ(VLIBCFileSetKeys(kPath, set.Get(), remove.Get(), kFormat), 0);
    EXPECT_EQ(ReadFile(kPath), "# wired\nDEVICE=ovs_eth0\nIPADDR=\nTYPE=OVS\nPRIMARY=eth0\n");
    EXPECT_THAT(scene::Names(kFolder), ElementsAre("ifcfg-eth0"));
}

TEST_F(KeyValue, OfAHashIsWrittenInTheOrderInWhichItWasPutThere)
{
    const Hash set({{"Z", "1"}, {"A", "2"}, {"M", "3"}, {"Z", "4"}});
    EXPECT_EQ(VLIBCFileSetKeys(kPath, set.Get(), nullptr, kFormat), 0);
    EXPECT_EQ(ReadFile(kPath), "Z=4\nA=2\nM=3\n");
}

TEST_F(KeyValue, OfAHashThatLacksOneIsNotWrittenAtAll)
{
    WriteFile(kPath, "A=1\n");
    const Hash broken({{"TYPE", "OVS"}, {"DEVICE", nullptr}});
    const Hash good({{"TYPE", "OVS"}});
    EXPECT_LT(VLIBCFileSetKeys(kPath, broken.Get(), nullptr, kFormat), 0);
    EXPECT_LT(VLIBCFileSetKeys(kPath, good.Get(), broken.Get(), kFormat), 0);
    const Hash refused({{"TYPE", "OVS"}, {"DEVICE", "a\nb"}});
    EXPECT_LT(VLIBCFileSetKeys(kPath, refused.Get(), nullptr, kFormat), 0);
    EXPECT_LT(VLIBCFileSetKeys(kPath, nullptr, nullptr, kFormat), 0);
    EXPECT_LT(VLIBCFileSetKeys(kPath, good.Get(), nullptr, "%s: %s\n"), 0);
    EXPECT_LT(VLIBCFileSetKeys(kPath, good.Get(), nullptr, nullptr), 0);
    EXPECT_EQ(ReadFile(kPath), "A=1\n");
}

TEST_F(KeyValue, OfAHashMakesTheFileUnlessThereIsNothingToWrite)
{
    const Hash none({});
    const Hash remove({{"A", ""}});
    EXPECT_LT(VLIBCFileSetKeys(kPath, none.Get(), remove.Get(), kFormat), 0);
    EXPECT_FALSE(scene::Exists(kPath));
    const Hash set({{"DEVICE", "eth0"}});
    EXPECT_EQ(VLIBCFileSetKeys(kPath, set.Get(), remove.Get(), kFormat), 0);
    EXPECT_EQ(ReadFile(kPath), "DEVICE=eth0\n");
}

TEST_F(KeyValue, IsKeptByEveryOneOfManyWritersAtOnce)
{
    WriteFile(kPath, "# shared\n");
    (void)::unlink("/tmp/gate");
    std::vector<std::unique_ptr<scene::Child>> writers;
    writers.reserve(8);
    for (int writer = 0; writer < 8; ++writer) {
        writers.push_back(std::make_unique<scene::Child>([writer] {
            int failures =
                scene::Within(std::chrono::seconds(10), [] { return scene::Exists("/tmp/gate"); })
                    ? 0
                    : 100;
            for (int key = 0; key < 50; ++key) {
                const std::string name = "K" + std::to_string(writer) + "_" + std::to_string(key);
                failures += VLIBCFileSetKeyValue(kPath, name.c_str(), "v", 0) == 0 ? 0 : 1;
            }
            return failures;
        }));
    }
    WriteFile("/tmp/gate", ""); // all at once
    for (const auto& writer : writers) {
        EXPECT_EQ(writer->Wait(), 0);
    }
    const std::string text = ReadFile(kPath);
    EXPECT_EQ(std::count(text.begin(), text.end(), '\n'), 401);
    EXPECT_THAT(scene::Names(kFolder), ElementsAre("ifcfg-eth0"));
}

TEST_F(KeyValue, IsReadWholeWhileItIsWritten)
{
    WriteFile(kPath, "A=1\nB=1\n");
    scene::Child writer([] {
        for (;;) {
            const Hash set({{"A", "2"}, {"B", "2"}});
            (void)VLIBCFileSetKeys(kPath, set.Get(), nullptr, kFormat);
            const Hash back({{"A", "1"}, {"B", "1"}});
            (void)VLIBCFileSetKeys(kPath, back.Get(), nullptr, kFormat);
        }
        return 0;
    });
    for (int round = 0; round < 500; ++round) {
        const std::string text = ReadFile(kPath);
        ASSERT_TRUE(text == "A=1\nB=1\n" || text == "A=2\nB=2\n") << text;
    }
}

} // namespace
