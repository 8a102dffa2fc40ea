#include "faults/ways.h"

#include "faults/contract.h"
#include "support/support.h"

#include <algorithm>
#include <cerrno>

namespace reliability {

namespace {

/** Puts the call's words in the places of $1, $2... */
std::string Filled(const std::string& text, const std::vector<std::string>& words)
{
    std::string filled;
    for (std::size_t at = 0; at < text.size(); ++at) {
        const bool place = text[at] == '$' && at + 1 < text.size();
        const auto number = place ? static_cast<std::size_t>(text[at + 1] - '0') : 0;
        filled += place && number < words.size() ? words[number] : std::string(1, text[at]);
        at += place ? 1 : 0;
    }
    return filled;
}

bool BeginsWith(const std::string& text, const std::string& words)
{
    return text.starts_with(words) && (text.size() == words.size() || text[words.size()] == ' ');
}

const Row* Find(const std::vector<Row>& rows, const std::string& text)
{
    const auto found = std::find_if(rows.begin(), rows.end(), [&](const Row& row) {
        return BeginsWith(text, row.call) &&
               (row.key.empty() || text.find(" " + row.key) != std::string::npos);
    });
    return found == rows.end() ? nullptr : &*found;
}

std::vector<Way> Each(const std::vector<int>& errors, Then then, const std::string& text = "")
{
    std::vector<Way> ways;
    for (const int error : errors) {
        ways.push_back({error, then, text});
    }
    return ways;
}

bool IsList(const std::string& path)
{
    return path.find("/vornovs/ovs_") != std::string::npos;
}

/** A list that cannot be opened is told of; one that cannot be written stays as it was. */
std::vector<Way> WaysOfOpening(const std::string& verb, const std::string& path, bool targetExists)
{
    const std::string fails = " Open " + path.substr(0, path.find(".new")) + " fails";
    if (verb == "open-folder") {
        return Each({EIO, EACCES, EMFILE}, Then::kSilent);
    }
    if (verb != "open-new" || !targetExists) {
        return Each({EIO, EACCES, EROFS, EMFILE, ENFILE, EDQUOT, ENOSPC}, Then::kLine, fails);
    }
    // A folder that is closed to us leaves the file itself, which is written in place.
    return Each({EIO, EROFS, ENOSPC, EDQUOT, EMFILE, EACCES, EPERM}, Then::kSilent);
}

std::vector<Way> WaysOfFile(const Point& point)
{
    const std::vector<std::string> words = unit::Words(point.text);
    const std::string& verb = words[0];
    const std::string& path = words[1];
    if (verb.starts_with("open-")) {
        return WaysOfOpening(verb, path, point.targetExists);
    }
    if (verb == "mkdir") {
        return Each({EROFS, ENOSPC, EDQUOT, EACCES, EIO}, Then::kLine, "Failed to mkdir [");
    }
    if (verb == "unlink" && !IsList(path)) {
        return Each({EROFS, EACCES, EIO, EBUSY}, Then::kLine, "Failed to unlink ");
    }
    const bool ofReplacement = path.find(".new") != std::string::npos;
    if (verb == "lstat" && !ofReplacement) {
        return Each({EIO, EACCES}, Then::kLine, " Open " + path + " fails");
    }
    if (verb == "lstat" || verb == "fstat" || verb == "flock" || verb == "ftruncate") {
        const Then then = point.targetExists ? Then::kSilent : Then::kLine;
        return Each({EIO, ENOLCK}, then, " Open " + path.substr(0, path.find(".new")) + " fails");
    }
    if (verb == "read") {
        return Each({EIO, EISDIR, EINTR}, Then::kAnswer); // what was read by then counts
    }
    if (verb == "write") {
        auto ways = Each({ENOSPC, EDQUOT, EIO, EROFS, EFBIG, EINTR}, Then::kSilent);
        ways.push_back({kShortWrite, Then::kSilent, ""});
        return ways;
    }
    return Each(verb == "rename"   ? std::vector<int>{EROFS, EIO, ENOSPC, EXDEV, EBUSY, EACCES}
                : verb == "fsync"  ? std::vector<int>{EIO, ENOSPC, EDQUOT}
                : verb == "unlink" ? std::vector<int>{EROFS, EACCES, EIO}
                                   : std::vector<int>{EIO, EPERM},
                Then::kSilent);
}

} // namespace

std::vector<Way> WaysOf(const Point& point, const std::vector<Row>& own)
{
    const std::vector<std::string> words = unit::Words(point.text);
    const Row* row = Find(own, point.text);
    if (row == nullptr && point.file) {
        return WaysOfFile(point);
    }
    row = row == nullptr ? Find(Contract(), point.text) : row;
    std::vector<Way> ways = row == nullptr ? std::vector<Way>() : row->ways;
    for (Way& way : ways) {
        way.text = Filled(way.text, words);
    }
    return ways;
}

std::string NameOf(const Way& way)
{
    return way.output ? "ends with wait status " + std::to_string(way.result) +
                            " after printing '" + way.output->substr(0, 20) + "'"
                      : "gives " + std::to_string(way.result);
}

} // namespace reliability
