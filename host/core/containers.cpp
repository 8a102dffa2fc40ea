#include "core/containers.h"

#include "core/guard.h"

#include <algorithm>
#include <climits>
#include <memory>
#include <string_view>
#include <type_traits>

namespace {

using vornhost::Guarded;
using vornhost::StringList;

/** Room that is made at once; a size is a hint, and a wild one must not take all the memory. */
constexpr int kMostReserved = 4096;

size_t Reserved(int size)
{
    return static_cast<size_t>(std::clamp(size, 0, kMostReserved));
}

static_assert(std::is_standard_layout_v<StringList>, "a list is its first member too");

StringList* Body(VLIBCSzList* list)
{
    return reinterpret_cast<StringList*>(list);
}

} // namespace

VLIBCSzHash* VLIBCSzHashAlloc(int size)
{
    return Guarded<VLIBCSzHash*>(nullptr, [&] {
        auto hash = std::make_unique<VLIBCSzHash>();
        hash->entries.reserve(Reserved(size));
        return hash.release();
    });
}

int VLIBCSzHashSetValue(VLIBCSzHash** hash, const char* key, const char* value)
{
    if (hash == nullptr || *hash == nullptr) {
        return -1;
    }
    const int result = Guarded(-1, [&] {
        if (key == nullptr || value == nullptr) {
            return -1;
        }
        auto& entries = (*hash)->entries;
        const auto found = std::find_if(entries.begin(), entries.end(),
                                        [&](const auto& entry) { return entry.first == key; });
        if (found != entries.end()) {
            found->second = value;
        } else {
            entries.emplace_back(key, value);
        }
        return 0;
    });
    // Callers do not look at the result; what they do with the hash later fails instead.
    (*hash)->incomplete = (*hash)->incomplete || result < 0;
    return result;
}

void VLIBCSzHashFree(VLIBCSzHash* hash)
{
    delete hash;
}

VLIBCSzList* VLIBCSzListAlloc(int size)
{
    return Guarded<VLIBCSzList*>(nullptr, [&] {
        auto list = std::make_unique<StringList>();
        list->items.reserve(Reserved(size));
        return &list.release()->head;
    });
}

const char* VLIBCSzListGet(VLIBCSzList* list, int index)
{
    if (list == nullptr || index < 0 || index >= list->nItem) {
        return nullptr;
    }
    return Body(list)->items[static_cast<size_t>(index)].c_str();
}

void VLIBCSzListFree(VLIBCSzList* list)
{
    delete Body(list);
}

/**
 * Each character of the separator separates. There is no piece between two separators that follow
 * each other, nor before a first or after a last one: names are what is listed, and none is empty.
 */
int VLIBCStrSep(const char* text, const char* separator, VLIBCSzList** list)
{
    if (text == nullptr || separator == nullptr || list == nullptr || *list == nullptr) {
        return -1;
    }
    return Guarded(-1, [&] {
        StringList& body = *Body(*list);
        std::vector<std::string> items = body.items; // all of the pieces or none
        const std::string_view whole = text;
        for (size_t begin = whole.find_first_not_of(separator); begin < whole.size();) {
            const size_t end = std::min(whole.find_first_of(separator, begin), whole.size());
            items.emplace_back(whole.substr(begin, end - begin));
            begin = whole.find_first_not_of(separator, end);
        }
        if (items.size() > INT_MAX) {
            return -1;
        }
        body.items = std::move(items);
        body.head.nItem = static_cast<int>(body.items.size());
        return 0;
    });
}
