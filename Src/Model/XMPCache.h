// The XMP packets of an editing session that are not stored yet.
#pragma once

#include <map>

#include "ZOClient/Types.h"

namespace ZOCL {

/// Guarded by its owner.
class XMPCache {
public:
    struct Packet {
        shared_ptr<RecycledMemory const> text;
        /// A change of this client's, and not a copy of what the server holds.
        bool isDirty = false;
    };
    struct Alphabetical {
        bool operator()(const ImmutableString& inLeft, const ImmutableString& inRight) const noexcept {
            return inLeft.view() < inRight.view();
        }
    };
    using Packets = std::map<ImmutableString, Packet, Alphabetical>;

    /// A copy leaves a change as it is. The packet that is not kept is in ioPacket afterwards.
    void Put(const ImmutableString& inKey, Packet& ioPacket);
    /// Packets that were taken before; those that came meanwhile are newer.
    void PutBack(const Packets& inPackets);
    /// Null unless there is a change.
    shared_ptr<RecycledMemory const> FindChange(const ImmutableString& inKey) const;

    const Packets& All() const noexcept { return mPackets; }
    void Swap(Packets& ioPackets) noexcept { mPackets.swap(ioPackets); }

private:
    Packets mPackets;
};

}  // namespace ZOCL
