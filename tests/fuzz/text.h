/**
 * A made-up text taken apart.
 */
#ifndef VORNOVS_TESTS_FUZZ_TEXT_H
#define VORNOVS_TESTS_FUZZ_TEXT_H

#include <string>
#include <string_view>
#include <vector>

namespace fuzz {

/** @return what stands before the separator, which the text begins behind afterwards. */
std::string TakeUpTo(std::string_view separator, std::string_view& text);

/** @return the text's lines with their line breaks. */
std::vector<std::string> LinesOf(std::string_view text);

/** @return the line without its LF, CR LF, or, at the end of a file, CR. */
std::string Content(std::string_view line);

/** @return the words between blanks. */
std::vector<std::string> WordsOf(std::string_view text);

/** One line of orders to a subject, such as "set eth0 1": words, and further ones that are empty.
 */
std::vector<std::string> Order(std::string_view line, std::size_t words);

/** Whether a text holds a line break or another control character. */
bool HasControls(std::string_view text);

/** @return the file's text; nothing at all when it cannot be read. */
std::string ReadFile(const std::string& path);
void WriteFile(const std::string& path, std::string_view text);
bool Exists(const std::string& path);

/** @return the names of what is in a folder, sorted. */
std::vector<std::string> EntriesOf(const std::string& folder);

/** Makes a folder with nothing in it. */
void MakeEmptyFolder(const std::string& folder);

} // namespace fuzz

#endif
