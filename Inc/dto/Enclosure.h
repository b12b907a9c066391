// An enclosure as the server tells of it, and a list of them.
#pragma once

#include "dto/TransferStructure.h"

namespace ZOCL {
namespace dto {

class Enclosure : public TransferStructure<Enclosure> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::Enclosure";
    static const BindingTable& Table();

    ImmutableString GetETag() const { return String("zo:etag"); }
    ImmutableString ContentID() const { return String("zo:enclosureContentId"); }
    ImmutableString Identifier() const { return String("zo:enclosureId"); }
    ImmutableString Name() const { return String("name"); }
};

class ContainedEnclosures : public TransferStructure<ContainedEnclosures> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::ContainedEnclosures";
    static const BindingTable& Table();

    BoundList<Enclosure> Enclosures() const { return List<Enclosure>("enclosures"); }
};

}  // namespace dto
}  // namespace ZOCL
