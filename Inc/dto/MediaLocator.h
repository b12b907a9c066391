// A media locator as the server tells of it.
#pragma once

#include "dto/TransferStructure.h"

namespace ZOCL {
namespace dto {

class MediaLocator : public TransferStructure<MediaLocator> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::MediaLocator";
    static const BindingTable& Table();

    ImmutableString Identifier() const { return String("zo:mediaLocatorId"); }
    JSONValue Properties() const { return Object("properties"); }
};

/// The keys of MediaLocatorProperties.
const BindingTable& MediaLocatorPropertiesTable();

}  // namespace dto
}  // namespace ZOCL
