// A rendition as the server tells of it, and a list of them.
#pragma once

#include "dto/TransferStructure.h"

namespace ZOCL {
namespace dto {

class Rendition : public TransferStructure<Rendition> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::Rendition";
    static const BindingTable& Table();

    ImmutableString Identifier() const { return String("zo:renditionId"); }
    ImmutableString ContentID() const { return String("zo:renditionContentId"); }
    /// The flavour.
    ImmutableString MimeType() const { return Structure<BoundObject>("properties").String("zo:mimeType"); }
};

class ContainedRenditions : public TransferStructure<ContainedRenditions> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::ContainedRenditions";
    static const BindingTable& Table();

    BoundList<Rendition> Renditions() const { return List<Rendition>("renditions"); }
};

}  // namespace dto
}  // namespace ZOCL
