// The base of the transfer structures: a checked body with its links.
#pragma once

#include "Links.h"
#include "ostcore/serialization/JSON.h"
#include "ostcore/serialization/JSONBinding.h"

namespace ZOCL {
namespace dto {

using ostcore::serialization::AlreadyChecked;
using ostcore::serialization::BindingField;
using ostcore::serialization::BindingKind;
using ostcore::serialization::BindingTable;
using ostcore::serialization::BoundList;
using ostcore::serialization::BoundObject;
using ostcore::serialization::JSONValue;
using ostcore::serialization::JSONView;

/// What every transfer structure has. Derived names its keys in a static Table() and itself in kName.
/// A structure is a handle on a parsed body: its types are checked when it is made, strings are interned and
/// lists found when they are asked for.
template <class Derived>
class TransferStructure : public BoundObject {
public:
    TransferStructure() = default;
    /// Throws boost::bad_any_cast or std::runtime_error for a body that does not fit.
    explicit TransferStructure(const JSONValue& inBody) : BoundObject(inBody, Derived::Table()) {}
    TransferStructure(const JSONValue& inBody, AlreadyChecked inTag) noexcept : BoundObject(inBody, inTag) {}

    /// From text, with the serialiser's envelope or without it. Throws as above.
    static Derived FromJSON(std::string_view inText) {
        return Derived(
            ostcore::serialization::UnwrapSerializerObject(ostcore::serialization::JSONParse(inText)));
    }

    Links GetLinks() const { return ReadLinks(Body()); }
    /// The tag that the body itself carries; structures that know one hide this.
    ImmutableString GetETag() const { return ImmutableString(); }
};

/// The keys of a link.
const BindingTable& LinkTable();

}  // namespace dto
}  // namespace ZOCL
