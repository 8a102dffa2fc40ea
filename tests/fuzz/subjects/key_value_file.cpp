/**
 * The platform's functions on key=value files. The text is orders, a line of its own with a dot,
 * and the file's text; without the dot there is no file.
 */
#include "subject.h"
#include "text.h"

#include "support/keyvaluefile.h"

#include <memory>
#include <optional>

#include <sys/stat.h>
#include <vornplatform/core.h>

namespace {

using fuzz::Expect;
using vornhost::KeyValueFile;

constexpr char kFolder[] = "/etc/sysconfig/network-scripts";
constexpr char kPath[] = "/etc/sysconfig/network-scripts/ifcfg-eth0";
constexpr char kFormat[] = "%s=%s\n";
constexpr mode_t kMode = 0640;

/** What the file has to hold; nothing: there is none. */
using Expected = std::optional<KeyValueFile>;

void Set(const std::string& key, const std::string& value, Expected& expected)
{
    KeyValueFile file = expected.value_or(KeyValueFile::Parse(""));
    const bool works = file.Set(key, value);
    Expect((VLIBCFileSetKeyValue(kPath, key.c_str(), value.c_str(), 0) == 0) == works,
           "SetKeyValue answers the wrong thing");
    if (works) {
        expected = file;
    }
}

void Remove(const std::string& key, Expected& expected)
{
    const bool works = expected && KeyValueFile::IsKey(key);
    Expect((VLIBCFileRemoveKey(kPath, key.c_str()) == 0) == works,
           "RemoveKey answers the wrong thing");
    if (works) {
        (void)expected->Remove(key);
    }
}

/** Sets one key and removes another in one step. */
void SetAndRemove(const std::vector<std::string>& order, Expected& expected)
{
    const std::unique_ptr<VLIBCSzHash, void (*)(VLIBCSzHash*)> made(VLIBCSzHashAlloc(1024),
                                                                    VLIBCSzHashFree);
    const std::unique_ptr<VLIBCSzHash, void (*)(VLIBCSzHash*)> gone(VLIBCSzHashAlloc(1024),
                                                                    VLIBCSzHashFree);
    VLIBCSzHash* set = made.get();
    VLIBCSzHash* remove = gone.get();
    (void)VLIBCSzHashSetValue(&set, order[1].c_str(), order[2].c_str());
    (void)VLIBCSzHashSetValue(&remove, order[3].c_str(), "");

    KeyValueFile file = expected.value_or(KeyValueFile::Parse(""));
    const bool works = file.Set(order[1], order[2]) && KeyValueFile::IsKey(order[3]);
    Expect((VLIBCFileSetKeys(kPath, set, remove, kFormat) == 0) == works,
           "SetKeys answers the wrong thing");
    if (works) {
        (void)file.Remove(order[3]);
        expected = file;
    }
}

/** A buffer of its own for each size, so that a byte too many is seen. */
void Get(const std::string& key, const Expected& expected)
{
    const auto value = expected ? expected->Get(key) : std::nullopt;
    const std::size_t length = value ? value->size() : 0;
    for (const std::size_t size : {length, length + 1}) {
        const std::unique_ptr<char[]> buffer(new char[size]);
        const int result =
            VLIBCFileGetKeyValue(kPath, key.c_str(), buffer.get(), static_cast<int>(size), 0);
        const bool fits = value && size > length;
        Expect((result == 0) == fits, "GetKeyValue answers the wrong thing");
        // What a C string cannot hold ends it.
        Expect(!fits || buffer.get() == std::string(value->c_str()), "GetKeyValue reads another");
    }
    Expect(!value || VLIBCFileCheckKeyValue(kPath, key.c_str(), value->c_str(), 0) ==
                         (value->find('\0') == std::string::npos ? 1 : 0),
           "CheckKeyValue answers the wrong thing");
}

void Carry(const std::string& line, Expected& expected)
{
    const auto order = fuzz::Order(line.substr(0, line.find('\0')), 4);
    if (order[0] == "set") {
        Set(order[1], order[2], expected);
    } else if (order[0] == "remove") {
        Remove(order[1], expected);
    } else if (order[0] == "both") {
        SetAndRemove(order, expected);
    } else {
        Get(order[0], expected);
    }
}

void Run(std::string_view text)
{
    const bool isThere = text.find("\n.\n") != std::string_view::npos;
    const std::string orders = fuzz::TakeUpTo("\n.\n", text);
    fuzz::MakeEmptyFolder(kFolder);
    Expected expected;
    if (isThere) {
        fuzz::WriteFile(kPath, text);
        ::chmod(kPath, kMode);
        expected = KeyValueFile::Parse(std::string(text));
    }
    constexpr int kMostOrders = 6;
    int left = kMostOrders;
    for (const std::string& line : fuzz::LinesOf(orders)) {
        if (left-- > 0) {
            Carry(fuzz::Content(line), expected);
        }
    }

    Expect(fuzz::Exists(kPath) == expected.has_value(), "there is a file, or there is none");
    Expect(fuzz::EntriesOf(kFolder).size() == (expected ? 1U : 0U), "something stands beside it");
    Expect(!expected || fuzz::ReadFile(kPath) == expected->Text(), "the file holds another text");
    struct stat status {};
    Expect(!isThere || (::stat(kPath, &status) == 0 && (status.st_mode & 07777) == kMode),
           "the file lost its mode");
}

const fuzz::Subject kSubject("key_value_file", Run);

} // namespace
