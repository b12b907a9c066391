// Writes new clips by single requests.
#include "NewClip.h"

#include "ostcore/utility/StringConversion.h"

namespace zo {

using ZOCL::ImmutableString;

ImmutableString LocatorIDOf(const NewClip& inClip) {
    return ZOCL::IZOCMediaLocator::CreateMediaLocatorID(inClip.document, inClip.contentState);
}

ZOCL::AssetBaseProperties PropertiesOf(const NewClip& inClip) {
    ZOCL::AssetBaseProperties properties;
    properties.name = ostcore::utility::ToUTF16(inClip.name);
    properties.assetType = ZOCL::kAssetType_MasterClip;
    properties.mediaLocator = LocatorIDOf(inClip);
    properties.parent = inClip.parent;
    return properties;
}

ZOCL::InterfaceRef<ZOCL::IZOCMediaLocator> LocatorOf(const ZOCL::InterfaceRef<ZOCL::IZOCDataServer>& inServer,
                                                     const NewClip& inClip) {
    const auto locator = inServer->GetMediaLocator(LocatorIDOf(inClip));
    if (!locator) {
        throw Failure(ExitCode::Failure, "adding " + inClip.path + ": the hub keeps no media locators");
    }
    locator->SetDocumentIDAndContentState(inClip.document, inClip.contentState);
    locator->SetMediaHRef(ImmutableString(inClip.href));
    locator->SetDisplayName(ImmutableString(inClip.name));
    return locator;
}

void ClipOnItsWay::Start() {
    try {
        const auto locator = LocatorOf(mServer, mClip);
        Step(
            "telling where the media lies",
            [locator](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                return locator->Store(inRequest, inCompletion);
            },
            &ClipOnItsWay::OnLocatorStored);
    } catch (const Failure& failure) {
        Fail(failure);
    }
}

void ClipOnItsWay::StartWithAsset() {
    OnLocatorStored(Outcome{});
}

void ClipOnItsWay::Step(const char* inWhat, const StartFunction& inStart, Next inNext) {
    const auto self = shared_from_this();
    const auto server = mServer;
    mContext.Loop().Start(
        inStart, [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); },
        [self, inWhat, inNext](const Outcome& inOutcome) { self->OnStepDone(inWhat, inNext, inOutcome); });
}

void ClipOnItsWay::OnStepDone(const char* inWhat, Next inNext, const Outcome& inOutcome) {
    if (!inOutcome.Succeeded()) {
        return Fail(Failure::OfRequest(What() + ", " + inWhat, inOutcome.result, inOutcome.response));
    }
    try {
        (this->*inNext)(inOutcome);
    } catch (const Failure& failure) {
        Fail(failure);
    } catch (const std::exception& error) {
        Fail(Failure(ExitCode::Failure, What() + ": " + error.what()));
    }
}

void ClipOnItsWay::OnLocatorStored(const Outcome&) {
    Step(
        "making the asset",
        [this](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return mTransaction.transaction->CreateNewAsset(inRequest, inCompletion, PropertiesOf(mClip));
        },
        &ClipOnItsWay::OnAssetMade);
}

void ClipOnItsWay::OnAssetMade(const Outcome& inOutcome) {
    const auto asset = RFL::QueryInterface<ZOCL::IZOCAsset>(inOutcome.resource);
    mWritable = RFL::QueryInterface<ZOCL::IZOCWritableAsset>(inOutcome.resource);
    if (!asset || !mWritable) {
        return Fail(Failure(ExitCode::Failure, What() + ": the hub's answer is not what it should be"));
    }
    mAssetID = asset->GetAssetIdentifier().str();
    if (!mClip.sidecar) {
        return OnSidecarWritten(inOutcome);
    }
    Step(
        "writing its sidecar",
        [this](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return ZOCL::CreateEnclosure(inRequest, mWritable->GetEnclosureFactoryURL(), mServer,
                                         ZOCL::GetXMPEnclosureName(LocatorIDOf(mClip)), mClip.sidecar,
                                         inCompletion);
        },
        &ClipOnItsWay::OnSidecarWritten);
}

void ClipOnItsWay::OnSidecarWritten(const Outcome& inOutcome) {
    if (!mClip.rendition) {
        return OnRenditionWritten(inOutcome);
    }
    Step(
        "writing its rendition",
        [this](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return ZOCL::IZOCWritableRenditions::CreateRendition(mServer, mWritable->GetRenditionFactoryURL(),
                                                                 ImmutableString(mClip.renditionType),
                                                                 mClip.rendition, inRequest, inCompletion);
        },
        &ClipOnItsWay::OnRenditionWritten);
}

void ClipOnItsWay::OnRenditionWritten(const Outcome&) {
    mDone(*this, nullptr);
}

}  // namespace zo
