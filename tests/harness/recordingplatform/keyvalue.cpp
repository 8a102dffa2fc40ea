// Key=value files, hashes, lists and texts.
#include "recordingplatform/keyvaluemodel.h"
#include "recordingplatform/recorder.h"

#include <vornplatform/core.h>

#include <gtest/gtest.h>

#include <cstring>

#include <sys/stat.h>

using harness::CallText;
using harness::Expect;
using harness::KeyValues;
using harness::PlatformCall;
using harness::Recorder;
using harness::Text;

struct VLIBCSzHash {
    KeyValues entries;
};

namespace {

constexpr int kHashSize = 1024;
constexpr int kListSize = 512;
constexpr char kLineFormat[] = "%s=%s\n";

struct List : VLIBCSzList {
    std::vector<std::string> items;
};

int CarryOut(const Recorder& recorder, const std::string& path, const KeyValues& set,
             const KeyValues& remove)
{
    return !recorder.m_carryOutEdits || harness::EditFile(path, set, remove) ? 0 : -1;
}

std::optional<std::string> FindValue(const Recorder& recorder, const std::string& path,
                                     const std::string& key)
{
    const auto set = recorder.m_values.find({path, key});
    if (set != recorder.m_values.end()) {
        return set->second;
    }
    return recorder.m_carryOutEdits ? harness::ReadKey(path, key) : std::nullopt;
}

/** Growing moves the hash: whoever kept the old handle is found out. */
void MoveHash(Recorder& recorder, VLIBCSzHash** hash)
{
    auto* const moved = new VLIBCSzHash(std::move(**hash));
    recorder.m_open.erase(*hash);
    delete *hash;
    recorder.Open(moved, "a hash", [moved] { delete moved; });
    *hash = moved;
}

} // namespace

int VLIBCFileGetKeyValue(const char* path, const char* key, char* value, int size, int flags)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileGetKeyValue");
    const std::string file = Text("VLIBCFileGetKeyValue", path);
    const std::string name = Text("VLIBCFileGetKeyValue", key);
    Expect("VLIBCFileGetKeyValue", "size", size, 1024);
    Expect("VLIBCFileGetKeyValue", "flags", flags, 0);

    const std::optional<int> answer = recorder.Call(CallText("VLIBCFileGetKeyValue", {file, name}));
    if (answer) {
        return *answer;
    }
    const auto found = FindValue(recorder, file, name);
    if (!found) {
        return -1;
    }
    value[found->copy(value, static_cast<std::size_t>(size) - 1)] = '\0';
    return 0;
}

int VLIBCFileSetKeyValue(const char* path, const char* key, const char* value, int flags)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileSetKeyValue");
    const std::string file = Text("VLIBCFileSetKeyValue", path);
    const KeyValues set{{Text("VLIBCFileSetKeyValue", key), Text("VLIBCFileSetKeyValue", value)}};
    Expect("VLIBCFileSetKeyValue", "flags", flags, 0);

    const std::optional<int> answer =
        recorder.Call(CallText("VLIBCFileSetKeyValue", {file, set[0].first + "=" + set[0].second}));
    return answer ? *answer : CarryOut(recorder, file, set, {});
}

int VLIBCFileSetKeys(const char* path, VLIBCSzHash* set, VLIBCSzHash* remove, const char* format)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileSetKeys");
    const std::string file = Text("VLIBCFileSetKeys", path);
    EXPECT_STREQ(format, kLineFormat);
    if (!recorder.IsOpen(set, "VLIBCFileSetKeys") ||
        (remove != nullptr && !recorder.IsOpen(remove, "VLIBCFileSetKeys"))) {
        return -1;
    }

    const KeyValues removed = remove != nullptr ? remove->entries : KeyValues();
    std::vector<std::string> words{file};
    for (const auto& [key, value] : set->entries) {
        words.push_back(key);
        words.back() += "=" + value;
    }
    for (const auto& [key, value] : removed) {
        words.push_back("-" + key);
        EXPECT_EQ(value, "") << "VLIBCFileSetKeys: a key to remove has a value";
    }
    const std::optional<int> answer = recorder.Call(CallText("VLIBCFileSetKeys", words));
    return answer ? *answer : CarryOut(recorder, file, set->entries, removed);
}

int VLIBCFileRemoveKey(const char* path, const char* key)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileRemoveKey");
    const std::string file = Text("VLIBCFileRemoveKey", path);
    const KeyValues remove{{Text("VLIBCFileRemoveKey", key), ""}};

    const std::optional<int> answer =
        recorder.Call(CallText("VLIBCFileRemoveKey", {file, remove[0].first}));
    return answer ? *answer : CarryOut(recorder, file, {}, remove);
}

int VLIBCFileCheckKeyValue(const char* path, const char* key, const char* value, int flags)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileCheckKeyValue");
    Expect("VLIBCFileCheckKeyValue", "flags", flags, 0);
    return recorder
        .Call(CallText("VLIBCFileCheckKeyValue",
                       {Text("VLIBCFileCheckKeyValue", path), Text("VLIBCFileCheckKeyValue", key),
                        Text("VLIBCFileCheckKeyValue", value)}))
        .value_or(0);
}

int VLIBCFileExist(const char* path)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileExist");
    const std::string file = Text("VLIBCFileExist", path);
    const std::optional<int> answer = recorder.Call(CallText("VLIBCFileExist", {file}));
    struct stat status {};
    return answer ? *answer : static_cast<int>(stat(file.c_str(), &status) == 0);
}

int VLIBCFileCheckDir(const char* path)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCFileCheckDir");
    const std::string folder = Text("VLIBCFileCheckDir", path);
    const std::optional<int> answer = recorder.Call(CallText("VLIBCFileCheckDir", {folder}));
    struct stat status {};
    return answer ? *answer
                  : static_cast<int>(stat(folder.c_str(), &status) == 0 && S_ISDIR(status.st_mode));
}

VLIBCSzHash* VLIBCSzHashAlloc(int size)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCSzHashAlloc");
    Expect("VLIBCSzHashAlloc", "size", size, kHashSize);
    if (recorder.Housekeeping("VLIBCSzHashAlloc").value_or(1) == 0) {
        return nullptr;
    }
    auto* const hash = new VLIBCSzHash;
    recorder.Open(hash, "a hash", [hash] { delete hash; });
    return hash;
}

int VLIBCSzHashSetValue(VLIBCSzHash** hash, const char* key, const char* value)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCSzHashSetValue");
    const std::string name = Text("VLIBCSzHashSetValue", key);
    const std::string text = Text("VLIBCSzHashSetValue", value);
    const std::optional<int> answer =
        recorder.Housekeeping(CallText("VLIBCSzHashSetValue", {name, text}));
    if (!recorder.IsOpen(*hash, "VLIBCSzHashSetValue")) {
        return -1;
    }
    if (answer && *answer < 0) {
        return *answer;
    }

    MoveHash(recorder, hash);
    for (auto& entry : (*hash)->entries) {
        if (entry.first == name) {
            entry.second = text;
            return 0;
        }
    }
    (*hash)->entries.emplace_back(name, text);
    return answer.value_or(0);
}

void VLIBCSzHashFree(VLIBCSzHash* hash)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCSzHashFree");
    (void)recorder.Housekeeping("VLIBCSzHashFree");
    if (recorder.Close(hash, "VLIBCSzHashFree")) {
        delete hash;
    }
}

VLIBCSzList* VLIBCSzListAlloc(int size)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCSzListAlloc");
    Expect("VLIBCSzListAlloc", "size", size, kListSize);
    if (recorder.Housekeeping("VLIBCSzListAlloc").value_or(1) == 0) {
        return nullptr;
    }
    auto* const list = new List;
    list->nItem = 0;
    recorder.Open(list, "a list", [list] { delete list; });
    return list;
}

const char* VLIBCSzListGet(VLIBCSzList* list, int index)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCSzListGet");
    if (!recorder.IsOpen(list, "VLIBCSzListGet") || index < 0 || index >= list->nItem) {
        return nullptr;
    }
    return static_cast<List*>(list)->items[static_cast<std::size_t>(index)].c_str();
}

void VLIBCSzListFree(VLIBCSzList* list)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCSzListFree");
    (void)recorder.Housekeeping("VLIBCSzListFree");
    if (recorder.Close(list, "VLIBCSzListFree")) {
        delete static_cast<List*>(list);
    }
}

/** As with the hash. */
List* MoveList(Recorder& recorder, VLIBCSzList** list)
{
    auto* const old = static_cast<List*>(*list);
    auto* const moved = new List(std::move(*old));
    recorder.m_open.erase(old);
    delete old;
    recorder.Open(moved, "a list", [moved] { delete moved; });
    *list = moved;
    return moved;
}

int VLIBCStrSep(const char* text, const char* separator, VLIBCSzList** list)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCStrSep");
    const std::string source = Text("VLIBCStrSep", text);
    const std::string blank = Text("VLIBCStrSep", separator);
    EXPECT_EQ(blank, " ") << "VLIBCStrSep: separator";
    if (!recorder.IsOpen(*list, "VLIBCStrSep")) {
        return -1;
    }
    const std::optional<int> answer = recorder.Housekeeping(CallText("VLIBCStrSep", {source}));
    List* const items = MoveList(recorder, list);
    for (std::size_t start = 0; start <= source.size();) {
        const std::size_t end = std::min(source.find(blank, start), source.size());
        items->items.push_back(source.substr(start, end - start));
        ++items->nItem;
        start = end + blank.size();
    }
    return answer.value_or(items->nItem);
}

int VLIBCStrTrimSpace(const char* source, char* destination)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCStrTrimSpace");
    const std::string text = Text("VLIBCStrTrimSpace", source);
    const std::optional<int> answer = recorder.Housekeeping(CallText("VLIBCStrTrimSpace", {text}));
    const std::size_t first = text.find_first_not_of(" \t\r\n");
    const std::size_t last = text.find_last_not_of(" \t\r\n");
    const std::string trimmed =
        first == std::string::npos ? std::string() : text.substr(first, last - first + 1);
    std::memcpy(destination, trimmed.c_str(), trimmed.size() + 1);
    return answer.value_or(0);
}
