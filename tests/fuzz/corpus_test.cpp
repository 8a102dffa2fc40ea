#include "subject.h"
#include "text.h"

#include <gtest/gtest.h>

namespace {

/** What is kept of the texts that a subject was fed: those that reach most, and those that broke.
 */
std::vector<std::string> KeptTexts(const std::string& subject)
{
    std::vector<std::string> paths;
    const std::string folder = std::string(VORNOVS_CORPUS) + "/" + subject;
    for (const std::string& name : fuzz::EntriesOf(folder)) {
        paths.push_back(folder + "/" + name);
    }
    return paths;
}

std::vector<std::string> SubjectNames()
{
    std::vector<std::string> names;
    for (const auto& [name, feed] : fuzz::Subjects()) {
        names.push_back(name);
    }
    return names;
}

class Corpus : public testing::TestWithParam<std::string> {};

TEST_P(Corpus, HoldsForEveryTextThatIsKept)
{
    const fuzz::Feed feed = fuzz::Subjects().at(GetParam());
    const std::vector<std::string> paths = KeptTexts(GetParam());
    ASSERT_FALSE(paths.empty());
    for (const std::string& path : paths) {
        const std::string text = fuzz::ReadFile(path);
        EXPECT_NO_THROW(feed(text)) << path;
    }
}

TEST_P(Corpus, HoldsForNothing)
{
    EXPECT_NO_THROW(fuzz::Subjects().at(GetParam())(""));
}

INSTANTIATE_TEST_SUITE_P(Readers, Corpus, testing::ValuesIn(SubjectNames()),
                         [](const testing::TestParamInfo<std::string>& row) { return row.param; });

} // namespace
