// A bulk form, read and checked as far as that goes without looking at the production: it happens before the
// database is locked for writing.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Http/Multipart.h"
#include "Model/Objects.h"

namespace zohub {

/// An enclosure or a rendition that the form brings.
struct BulkItem {
    FormPart const* part = nullptr;  ///< with the data
    std::string_view id;             ///< of one that exists; empty for a new one
    std::string_view name;           ///< of a new enclosure
    std::size_t index = 0;           ///< among those of its kind and owner
    std::string hash;                ///< of the data
};

struct BulkAsset {
    FormPart const* part = nullptr;        ///< the first about it
    std::string_view id;                   ///< of one that exists; empty for a new one
    std::size_t index = 0;                 ///< among the new ones; of one that exists, its place in the form
    std::optional<AssetState> properties;  ///< with nothing but what properties decide
    std::vector<BulkItem> enclosures;
    std::vector<BulkItem> renditions;
};

struct BulkForm {
    std::unique_ptr<Form const> form;
    std::vector<BulkAsset> assets;     ///< in the form's order
    std::vector<BulkItem> enclosures;  ///< of the production

    /// How messages speak of a part.
    std::string TitleOf(FormPart const& inPart) const;
    /// Throws Failure with a message that names the part.
    [[noreturn]] void Fail(FormPart const& inPart, int inStatus, char const* inCode,
                           std::string const& inWhy) const;
};

enum class BulkKind { Creation, Edit, Deletion };

/// Throws Failure 400, 413 or 415, whose message names the part at fault. The request must outlive the form.
std::shared_ptr<BulkForm const> ReadBulkForm(BulkKind inKind, Request const& inRequest);

}  // namespace zohub
