/**
 * The values of configuration files as text.
 */
#ifndef VORNHOST_SUPPORT_INTERFACEVALUES_H
#define VORNHOST_SUPPORT_INTERFACEVALUES_H

#include <optional>
#include <string>
#include <vector>

namespace vornhost {

std::string Lower(std::string text);

/** @return  the text without blanks at either end. */
std::string Trimmed(const std::string& text);

/** @return  what stands between blanks. */
std::vector<std::string> Words(const std::string& text);

std::string Joined(const std::vector<std::string>& words, const char* separator = " ");

/** @return  nothing when the text is no number within the bounds. */
std::optional<unsigned> ToNumber(const std::string& text, unsigned least, unsigned most);

/** @return  the address in its usual notation, empty when the text is none of the family. */
std::string NormalAddress(int family, const std::string& text);

/** @return  the length of a netmask's prefix, nothing when the text is no netmask. */
std::optional<unsigned> MaskLength(const std::string& mask);

} // namespace vornhost

#endif
