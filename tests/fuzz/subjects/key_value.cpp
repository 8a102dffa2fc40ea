/**
 * Key=value files as a text: read, set, removed. The text is a key, a value, and then the file.
 */
#include "subject.h"
#include "text.h"

#include "support/keyvaluefile.h"

#include <algorithm>

namespace {

using fuzz::Content;
using fuzz::Expect;
using fuzz::LinesOf;
using vornhost::KeyValueFile;

/** The key of a line by the file's rules, read in another way; empty: it has none. */
std::string KeyOf(const std::string& line)
{
    std::string key = line.substr(0, line.find('='));
    while (!key.empty() && (key.front() == ' ' || key.front() == '\t')) {
        key.erase(0, 1);
    }
    const bool counts = line.find('=') != std::string::npos && !key.starts_with('#');
    return counts ? key : "";
}

/** Its lines but those of a key; where the file ends, whether a line break follows is open. */
std::vector<std::string> OthersOf(const std::string& text, const std::string& key)
{
    std::vector<std::string> others;
    for (const std::string& line : LinesOf(text)) {
        if (KeyOf(line) != key) {
            others.push_back(line);
        }
    }
    return others;
}

/** Compares byte for byte but for the line breaks of what is or was the file's last line. */
void ExpectSameOthers(const std::string& before, const std::string& after, const std::string& key)
{
    const auto old = OthersOf(before, key);
    const auto kept = OthersOf(after, key);
    Expect(old.size() == kept.size(), "an edit made a line of another key or lost one");
    for (std::size_t at = 0; at < old.size(); ++at) {
        const bool isLast = at + 1 == old.size();
        Expect(old[at] == kept[at] || (isLast && Content(old[at]) == Content(kept[at])),
               "an edit changed the line of another key: " + old[at]);
    }
}

std::string WithoutQuotes(const std::string& value)
{
    std::string quoted = value;
    while (!quoted.empty() && (quoted.back() == ' ' || quoted.back() == '\t')) {
        quoted.pop_back();
    }
    const bool isQuoted = quoted.size() > 1 && quoted.front() == '"' && quoted.back() == '"';
    return isQuoted ? quoted.substr(1, quoted.size() - 2) : value;
}

void CheckReading(const KeyValueFile& file)
{
    std::vector<std::string> keys;
    for (const std::string& line : LinesOf(file.Text())) {
        const std::string key = KeyOf(line);
        if (!key.empty() && std::find(keys.begin(), keys.end(), key) == keys.end()) {
            keys.push_back(key);
        }
    }
    Expect(file.Keys() == keys, "the keys are others than those of the lines");
    const auto values = file.Values();
    Expect(values.size() == keys.size(), "there are more values than keys, or fewer");
    for (const std::string& key : keys) {
        Expect(file.Get(key) == values.at(key), "a key has two values");
    }
}

void CheckSetting(const std::string& text, const std::string& key, const std::string& value)
{
    KeyValueFile file = KeyValueFile::Parse(text);
    const bool wasThere = file.Get(key).has_value();
    if (!file.Set(key, value)) {
        Expect(!KeyValueFile::IsKey(key) || !KeyValueFile::IsValue(value), "a pair was refused");
        Expect(file.Text() == text, "a pair that was refused changed the file");
        return;
    }
    Expect(KeyValueFile::IsKey(key) && KeyValueFile::IsValue(value), "a wrong pair was taken");
    Expect(file.GetWritten(key) == value, "another value is there than was set");
    Expect(file.Get(key) == WithoutQuotes(value), "another value is read than was set");
    Expect(LinesOf(file.Text()).size() == OthersOf(file.Text(), key).size() + 1,
           "a key that was set stands there several times");
    ExpectSameOthers(text, file.Text(), key);

    const std::string once = file.Text();
    Expect(file.Set(key, value) && file.Text() == once, "setting a key again changed the file");
    Expect(file.Remove(key), "a key that was set could not be removed");
    Expect(wasThere || file.Text() == text, "setting and removing a new key changed the file");
}

void CheckRemoving(const std::string& text, const std::string& key)
{
    KeyValueFile file = KeyValueFile::Parse(text);
    const bool wasThere = file.Get(key).has_value();
    Expect(file.Remove(key) == wasThere, "Remove() does not tell whether the key was there");
    Expect(!file.Get(key), "a key that was removed is there");
    Expect(wasThere || file.Text() == text, "removing what is not there changed the file");
    ExpectSameOthers(text, file.Text(), key);
}

void Run(std::string_view text)
{
    const std::string key = fuzz::TakeUpTo("\n", text);
    const std::string value = fuzz::TakeUpTo("\n", text);
    const KeyValueFile file = KeyValueFile::Parse(std::string(text));
    Expect(file.Text() == text, "reading a file changed it");
    CheckReading(file);
    CheckSetting(file.Text(), key, value);
    CheckRemoving(file.Text(), key);
}

const fuzz::Subject kSubject("key_value", Run);

} // namespace
