// A media file as it becomes a master clip: its locator, asset, XMP packet and rendition.
#pragma once

#include <functional>
#include <memory>
#include <string>

#include "Failure.h"
#include "Payloads.h"

namespace zo {

struct NewClip {
    /// For people.
    std::string path;
    std::string name;
    /// What the media locator is named by.
    ZOCL::Guid document;
    ZOCL::Guid contentState;
    std::string href;
    /// Of the bin; null at the top.
    ZOCL::ImmutableString parent;
    /// The XMP packet; null when there is none.
    Payload sidecar;
    std::string renditionType;
    /// Null when there is none.
    Payload rendition;
};

ZOCL::ImmutableString LocatorIDOf(const NewClip& inClip);
ZOCL::AssetBaseProperties PropertiesOf(const NewClip& inClip);
/// What tells the hub where the media lies, not stored yet. Throws a Failure when the hub keeps no locators.
ZOCL::InterfaceRef<ZOCL::IZOCMediaLocator> LocatorOf(const ZOCL::InterfaceRef<ZOCL::IZOCDataServer>& inServer,
                                                     const NewClip& inClip);

/// One clip on its way into a transaction by single requests, one after the other. All on the main thread.
class ClipOnItsWay : public std::enable_shared_from_this<ClipOnItsWay> {
public:
    /// The failure is null when all is there. Must not throw.
    using Done = std::function<void(const ClipOnItsWay&, const Failure*)>;

    ClipOnItsWay(Context& ioContext, const OpenTransaction& inTransaction, NewClip inClip, Done inDone)
        : mContext(ioContext),
          mServer(ioContext.Server()),
          mTransaction(inTransaction),
          mClip(std::move(inClip)),
          mDone(std::move(inDone)) {}

    const NewClip& Clip() const { return mClip; }
    const std::string& AssetID() const { return mAssetID; }

    /// Ends with one call of the function, also when nothing could be started.
    void Start();
    /// The same for a clip whose locator the hub has.
    void StartWithAsset();

private:
    using Next = void (ClipOnItsWay::*)(const Outcome&);

    std::string What() const { return "adding " + mClip.path; }
    void Step(const char* inWhat, const StartFunction& inStart, Next inNext);
    void OnStepDone(const char* inWhat, Next inNext, const Outcome& inOutcome);
    void OnLocatorStored(const Outcome& inOutcome);
    void OnAssetMade(const Outcome& inOutcome);
    void OnSidecarWritten(const Outcome& inOutcome);
    void OnRenditionWritten(const Outcome& inOutcome);
    void Fail(const Failure& inFailure) { mDone(*this, &inFailure); }

    Context& mContext;
    const ZOCL::InterfaceRef<ZOCL::IZOCDataServer> mServer;
    const OpenTransaction mTransaction;
    const NewClip mClip;
    const Done mDone;
    ZOCL::InterfaceRef<ZOCL::IZOCWritableAsset> mWritable;
    std::string mAssetID;
};

}  // namespace zo
