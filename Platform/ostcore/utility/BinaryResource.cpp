// Look-up in the table of a library's files.
#include "ostcore/utility/BinaryResource.h"

#include <algorithm>

#include "ostcore/utility/StringConversion.h"

namespace ostcore {
namespace utility {

BinaryResource MakeBinaryResource(std::string_view inBytes) {
    const shared_ptr<char[]> bytes = boost::make_shared<char[]>(inBytes.size());
    std::copy(inBytes.begin(), inBytes.end(), bytes.get());
    return {bytes, inBytes.size()};
}

BinaryResource GetBinaryFromModule(const BinaryModule& inModule, std::string_view inType,
                                   std::string_view inName) {
    const BinaryEntry* const end = inModule.entries + inModule.count;
    const BinaryEntry* const found = std::find_if(inModule.entries, end, [&](const BinaryEntry& inEntry) {
        return inEntry.name == inName && EqualsIgnoreCaseASCII(inEntry.type, inType);
    });
    return found == end ? BinaryResource()
                        : MakeBinaryResource({reinterpret_cast<const char*>(found->bytes), found->size});
}

std::vector<std::string> GetBinaryNames(const BinaryModule& inModule, std::string_view inType) {
    std::vector<std::string> names;
    for (std::size_t i = 0; i < inModule.count; ++i) {
        if (EqualsIgnoreCaseASCII(inModule.entries[i].type, inType)) {
            names.emplace_back(inModule.entries[i].name);
        }
    }
    std::sort(names.begin(), names.end());
    return names;
}

}  // namespace utility
}  // namespace ostcore
