// The XMP packets of an editing session: keeping, reading, and handing them to a bulk transaction.
#include "Model/XMPCache.h"

#include "Model/Production.h"
#include "Model/ServerResourceWithEnclosures.h"
#include "ostcore/debug/Trace.h"
#include "ZOClient/IZOCBulkTransaction.h"

namespace ZOCL {

using ostcore::debug::kTraceLevel_Error;
using ostcore::debug::StructuredText;
using ostcore::threads::ScopedLock;

namespace {

constexpr const char* kChannel_ReadXMP = "Production.ReadXMP";

void TraceMissing(const ImmutableString& inURL, const ImmutableString& inName) {
    ostcore::debug::Trace(kChannel_ReadXMP, kTraceLevel_Error,
                          StructuredText("No XMP data to read because production did not have XMP enclosure")
                              .Add("uri", inURL)
                              .Add("enclosureName", inName));
}

void TraceFailure(const ImmutableString& inURL, const ImmutableString& inName) {
    ostcore::debug::Trace(kChannel_ReadXMP, kTraceLevel_Error,
                          StructuredText("Failed to load XMP enclosure for production")
                              .Add("enclosureName", inName)
                              .Add("uri", inURL));
}

}  // namespace

void XMPCache::Put(const ImmutableString& inKey, Packet& ioPacket) {
    Packet& present = mPackets[inKey];
    if (ioPacket.isDirty || !present.isDirty) {
        std::swap(present, ioPacket);
    }
}

void XMPCache::PutBack(const Packets& inPackets) {
    for (const auto& [key, former] : inPackets) {
        const auto [present, isAdded] = mPackets.emplace(key, former);
        if (!isAdded && former.isDirty && !present->second.isDirty) {
            present->second = former;
        }
    }
}

shared_ptr<RecycledMemory const> XMPCache::FindChange(const ImmutableString& inKey) const {
    const auto found = mPackets.find(inKey);
    return found != mPackets.end() && found->second.isDirty ? found->second.text : nullptr;
}

void Production::CacheXMP(const ImmutableString& inKey, const std::string& inPacket, bool inDirty) {
    if (inKey.empty() || !IsEditingSession()) {
        return;
    }
    XMPCache::Packet packet{RecycledMemory::CreateFromBytes(inPacket), inDirty};
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::CacheXMP()");
    mXMPCache.Put(inKey, packet);
    lock.Unlock();
}

bool Production::HasCachedXMPChanges() {
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::HasCachedXMPChanges()");
    return !mXMPCache.All().empty() || !mPropertyChanges.empty();
}

void Production::ClearXMPCache() {
    XMPCache::Packets forgotten;
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::ClearXMPCache()");
    mXMPCache.Swap(forgotten);
    lock.Unlock();
}

void Production::StoreCachedXMPChangesInBulkTransaction(const InterfaceRef<IZOCBulkTransaction>& inBulk) {
    if (!inBulk) {
        return;
    }
    XMPCache::Packets packets;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::StoreCachedXMPChangesInBulkTransaction()");
        packets = mXMPCache.All();
    }
    for (const auto& [key, packet] : packets) {
        inBulk->SetProductionEnclosure(GetXMPEnclosureName(key), packet.text, !packet.isDirty);
    }
}

shared_ptr<RecycledMemory const> Production::FindChangedXMP(const ImmutableString& inKey) {
    if (!IsEditingSession()) {
        return nullptr;
    }
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::ReadXMP");
    return mXMPCache.FindChange(inKey);
}

std::string Production::ReadXMP(const ImmutableString& inKey) {
    if (inKey.empty()) {
        return {};
    }
    if (const auto changed = FindChangedXMP(inKey)) {
        return std::string(changed->view());
    }
    const ImmutableString name = GetXMPEnclosureName(inKey);
    const InterfaceRef<IZOCEnclosures> enclosures = GetEnclosures();
    const auto list = RFL::QueryInterface<IZOCServerResource>(enclosures);
    if (!list || (!list->IsLoaded() && !list->Load(true))) {
        TraceFailure(GetHTTPURL(), name);
        return {};
    }
    const InterfaceRef<IZOCEnclosure> enclosure = enclosures->GetEnclosure(name);
    if (!enclosure) {
        TraceMissing(GetHTTPURL(), name);
        return {};
    }
    const auto payload = enclosure->GetEnclosurePayload();
    if (!payload) {
        TraceFailure(GetHTTPURL(), name);
        return {};
    }
    return std::string(payload->view());
}

std::string Production::ReadXMP(const InterfaceRef<IZOCAsset>& inItem) {
    return inItem ? ReadXMP(inItem->GetMediaLocatorIdentifier()) : std::string();
}

}  // namespace ZOCL
