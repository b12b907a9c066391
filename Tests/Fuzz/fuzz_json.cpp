// Any bytes either are refused with a std::runtime_error, or can be read, bound, changed and written, and
// what was written reads back as the same text.
#include <cstdint>
#include <cstdlib>
#include <stdexcept>

#include "ostcore/serialization/JSON.h"
#include "ostcore/serialization/JSONBinding.h"

using namespace ostcore::serialization;

namespace {

const BindingTable& Table() {
    static const BindingTable table{{"name", BindingKind::MandatoryString},
                                    {"tags", BindingKind::StringList},
                                    {"created", BindingKind::Date},
                                    {"time", BindingKind::TickTime},
                                    {"count", BindingKind::Integer},
                                    {"small", BindingKind::Integer32},
                                    {"on", BindingKind::Boolean},
                                    {"inner", BindingKind::Object, &Table},
                                    {"links", BindingKind::ObjectList, &Table}};
    return table;
}

/// A body that passed the table can be read without an exception.
void ReadBound(const BoundObject& inObject) {
    inObject.String("name");
    inObject.Strings("tags");
    inObject.Date("created");
    inObject.Ticks("time");
    inObject.Integer("count");
    inObject.Boolean("on", false);
    for (const BoundObject& link : inObject.List<BoundObject>("links")) {
        link.String("name");
    }
    ReadOptionalString(inObject.Structure<BoundObject>("inner").Body(), "name",
                       *std::make_unique<std::string>());
}

void BindIfItFits(const JSONValue& inRoot) {
    try {
        Table().Check(inRoot);
    } catch (const boost::bad_any_cast&) {
        return;
    } catch (const std::runtime_error&) {
        return;
    }
    ReadBound(BoundObject(inRoot, AlreadyChecked()));
}

void Require(bool inHolds) {
    if (!inHolds) {
        std::abort();
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* inBytes, std::size_t inSize) {
    JSONValue root;
    try {
        root = JSONParse(RecycledMemory::CreateFromBytes({reinterpret_cast<const char*>(inBytes), inSize}));
    } catch (const std::runtime_error&) {
        return 0;
    }
    const std::string text = GetJSONUTF8String(root);
    Require(GetJSONUTF8String(JSONParse(text)) == text);
    BindIfItFits(root);
    if (root.IsObject()) {
        JSONValue changed = root;
        AddToObject(changed, "added", "x");
        Require(GetVariantInObject(JSONParse(GetJSONUTF8String(changed)), "added").AsString() == "x");
        Require(GetJSONUTF8String(root) == text);
    }
    return 0;
}
