// The one pass that checks a body against its table.
#include "ostcore/serialization/JSONBinding.h"

#include <stdexcept>

namespace ostcore {
namespace serialization {

namespace {

void CheckStringList(JSONView inList) {
    inList.ForEachElement([](JSONView inElement) {
        if (!inElement.IsString()) {
            ThrowWrongJSONType();
        }
    });
}

void CheckTickTime(JSONView inTime) {
    const JSONView ticks = inTime.Find("ticks");
    if (!ticks.IsNull()) {
        ticks.AsInt64();
    }
}

void Require(bool inIsRightType) {
    if (!inIsRightType) {
        ThrowWrongJSONType();
    }
}

}  // namespace

BindingTable::BindingTable(std::initializer_list<BindingField> inFields) : mFields(inFields) {
    if (mFields.size() > kSlots / 2) {
        throw std::logic_error("A binding table has too many keys");
    }
    for (std::size_t position = 0; position < mFields.size(); ++position) {
        std::size_t slot = Slot(mFields[position].key);
        for (; mSlots[slot] != 0; slot = (slot + 1) % kSlots) {
            if (mFields[mSlots[slot] - 1u].key == mFields[position].key) {
                throw std::logic_error("A binding table has a key twice: " +
                                       std::string(mFields[position].key));
            }
        }
        mSlots[slot] = static_cast<std::uint8_t>(position + 1);
    }
}

const BindingField* BindingTable::FindField(std::string_view inKey, std::size_t& ioHint) const noexcept {
    // Servers write the keys of like objects in one order, mostly that of the table.
    if (ioHint < mFields.size() && mFields[ioHint].key == inKey) {
        return &mFields[ioHint++];
    }
    for (std::size_t slot = Slot(inKey); mSlots[slot] != 0; slot = (slot + 1) % kSlots) {
        const std::size_t position = mSlots[slot] - 1u;
        if (mFields[position].key == inKey) {
            ioHint = position + 1;
            return &mFields[position];
        }
    }
    return nullptr;
}

void BindingTable::Check(JSONView inObject) const {
    std::size_t hint = 0;
    inObject.ForEachMember([&](std::string_view inKey, JSONView inValue) {
        if (const BindingField* field = FindField(inKey, hint)) {
            CheckValue(*field, inValue);
        }
    });
}

void BindingTable::CheckValue(const BindingField& inField, JSONView inValue) {
    const JSONType type = inValue.Type();
    if (type == JSONType::Null) {
        Require(inField.kind != BindingKind::MandatoryString);
        return;
    }
    switch (inField.kind) {
        case BindingKind::MandatoryString:
        case BindingKind::OptionalString:
            Require(type == JSONType::String);
            break;
        case BindingKind::Boolean:
            Require(type == JSONType::Boolean);
            break;
        case BindingKind::Integer:
            inValue.AsInt64();
            break;
        case BindingKind::Integer32:
            inValue.AsInt32();
            break;
        case BindingKind::Number:
            Require(inValue.IsNumber());
            break;
        case BindingKind::Date:
            ParseDate(inValue.AsString());
            break;
        case BindingKind::StringList:
            CheckStringList(inValue);
            break;
        case BindingKind::TickTime:
            CheckTickTime(inValue);
            break;
        case BindingKind::Object:
            Require(type == JSONType::Object);
            if (inField.nested) {
                inField.nested().Check(inValue);
            }
            break;
        case BindingKind::ObjectList: {
            const BindingTable* table = inField.nested ? &inField.nested() : nullptr;
            inValue.ForEachElement([&](JSONView inElement) {
                Require(inElement.IsObject());
                if (table) {
                    table->Check(inElement);
                }
            });
            break;
        }
        case BindingKind::Any:
            break;
    }
}

}  // namespace serialization
}  // namespace ostcore
