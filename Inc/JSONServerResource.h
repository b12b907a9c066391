// A resource whose body is JSON, bound to a transfer structure, with the links that the body carries.
#pragma once

#include "dto/TransferStructure.h"
#include "ostcore/debug/Assert.h"
#include "Resources/JoinText.h"
#include "Resources/ServerResource.h"

namespace ZOCL {

/// What does not depend on the structure.
///
/// A body is parsed and checked on the thread of the completion, with no lock held; only its installation
/// takes the lock. A body that cannot be accepted leaves the resource unloaded, never as an exception; the
/// response stays for diagnosis.
class JSONServerResourceBase : public ServerResource {
public:
    using JSONValue = ostcore::serialization::JSONValue;

    /// The first link with this relation and, unless inType is null, this media type.
    Link GetLink(const ImmutableString& inRelation, const ImmutableString& inType = ImmutableString());
    ImmutableString GetLinkHref(const ImmutableString& inRelation);

    ImmutableString GetLatestVersionLink() override;
    ImmutableString GetEditLink() override;
    ImmutableString GetDeleteLink() override;
    ImmutableString GetParentLink() override;
    bool InternalInit(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
                      const shared_ptr<ostnet::Response>& inResponse, ResourceWritability inWritability,
                      bool inReportErrors) override;
    /// Everything that begins with "application/json", case and all.
    bool canLoadType(const ImmutableString& inContentType) override;

    /// Binds a value; null stands for a body that could not be parsed.
    virtual bool InternalJSONInit(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
                                  const shared_ptr<ostnet::Response>& inResponse, const JSONValue& inValue,
                                  ResourceWritability inWritability) = 0;

protected:
    /// Runs after every installation of a body, with no lock held, also when it ended unloaded.
    virtual void PostLoadDTO() {}
    /// Once per kind of resource.
    virtual void AssertLoadableType(const std::string& inMessage) = 0;

    void InstallLocked(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
                       const shared_ptr<ostnet::Response>& inResponse, Links& ioLinks,
                       const ImmutableString& inBodyETag, bool inLoaded, ResourceWritability inWritability)
        ZO_REQUIRES(IZOCDataServer::GetLock());
    ImmutableString LinkHrefLocked(const ImmutableString& inRelation) const
        ZO_REQUIRES(IZOCDataServer::GetLock());
    /// Runs a function and traces what it throws; true when it threw nothing.
    static bool Guarded(const function<void()>& inBinding);

private:
    Links mLinks ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

/// T is a transfer structure (dto/TransferStructure.h).
template <class T>
class JSONServerResource : public JSONServerResourceBase {
public:
    /// Installs a body that was parsed here, or one that came inside of a list.
    virtual bool InternalDTOInit(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
                                 const shared_ptr<ostnet::Response>& inResponse, const T& inBody,
                                 bool inLoaded, ResourceWritability inWritability) {
        Links links = inBody.GetLinks();
        const ImmutableString tag = inBody.GetETag();
        T replaced = inBody;
        {
            ostcore::threads::ScopedLock lock(IZOCDataServer::GetLock(),
                                              "JSONServerResource::InternalDTOInit");
            std::swap(mBody, replaced);
            InstallLocked(inURL, inServer, inResponse, links, tag, inLoaded, inWritability);
        }
        PostLoadDTO();
        return inLoaded;
    }

    bool InternalJSONInit(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
                          const shared_ptr<ostnet::Response>& inResponse, const JSONValue& inValue,
                          ResourceWritability inWritability) override {
        T body;
        const bool loaded = !inValue.IsNull() && Guarded([&] {
            T bound(inValue);
            bound.GetLinks();
            body = bound;
        });
        return InternalDTOInit(inURL, inServer, inResponse, body, loaded, inWritability);
    }

protected:
    /// A handle on the body, to be read with no lock held.
    T GetBody(const char* inLabel) const {
        ostcore::threads::ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
        return mBody;
    }
    /// The body and whether the resource holds it, as one.
    T GetBody(const char* inLabel, bool& outLoaded) const {
        ostcore::threads::ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
        outLoaded = mLoaded;
        return mBody;
    }

    void AssertLoadableType(const std::string& inMessage) override {
        ZO_ASSERT_ONCE(false, JoinText("ZOCL::JSONServerResource<struct ", T::kName, ">::InternalInit"),
                       inMessage);
    }

    T mBody ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

}  // namespace ZOCL
