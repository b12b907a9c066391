// Adds a list of enclosures to a resource whose body holds one.
#pragma once

#include "Model/Enclosure.h"
#include "Model/ResourceCreation.h"
#include "Relations.h"
#include "Resources/Implements.h"

namespace ZOCL {

/// R is a JSON resource whose structure has Enclosures(). Enclosure objects are made when they are first
/// asked for, and the same ones are given out again until the list is loaded anew.
template <class R>
class ServerResourceWithEnclosures
    : public Implements<R, Readable<IZOCEnclosures>, Writable<IZOCWritableEnclosures>> {
public:
    InterfaceRef<IZOCEnclosure> GetEnclosure(const ImmutableString& inName) override {
        using ostcore::threads::ScopedLock;
        {
            ScopedLock lock(IZOCDataServer::GetLock(), "ServerResourceWithEnclosures::GetEnclosure");
            const auto found = mEnclosures.find(inName);
            if (found != mEnclosures.end()) {
                return found->second;
            }
        }
        const auto body = this->GetBody("ServerResourceWithEnclosures::GetEnclosure");
        for (const dto::Enclosure& contained : body.Enclosures()) {
            if (contained.Text("name") == inName.view()) {
                const auto made = MakeFromBody<Enclosure>(contained, ImmutableString(), this->GetServer(),
                                                          this->GetWritability());
                ScopedLock lock(IZOCDataServer::GetLock(), "ServerResourceWithEnclosures::GetEnclosure2");
                return mEnclosures.emplace(inName, made).first->second;
            }
        }
        return nullptr;
    }

    bool GetEnclosureByContentID(const ImmutableString& inContentID, const Guid& inRequestID,
                                 const RequestCompletion& inCompletion) override {
        const ImmutableString url = ExpandTemplate(
            this->GetLinkHref(kRelation_Enclosures_Enclosure_ByContentId), {{"{contentId}", inContentID}});
        const auto made = MakeAtURL<Enclosure>(url, this->GetServer(), this->GetWritability());
        return made && made->Load(inRequestID, inCompletion, true);
    }

    std::vector<ImmutableString> GetEnclosureNames() override {
        std::vector<ImmutableString> names;
        const auto enclosures = this->GetBody("ServerResourceWithEnclosures::GetEnclosureNames").Enclosures();
        names.reserve(enclosures.size());
        for (const dto::Enclosure& contained : enclosures) {
            names.push_back(contained.Name());
        }
        return names;
    }

    std::vector<ImmutableString> GetEnclosureIDs() override {
        std::vector<ImmutableString> identifiers;
        const auto enclosures = this->GetBody("ServerResourceWithEnclosures::GetEnclosureIDs").Enclosures();
        identifiers.reserve(enclosures.size());
        for (const dto::Enclosure& contained : enclosures) {
            identifiers.push_back(contained.Identifier());
        }
        return identifiers;
    }

    ImmutableString GetEnclosureFactoryURL() override { return this->GetLinkHref(kRelation_Create); }

    /// Makes an enclosure known that was created after the list was loaded.
    void AddEnclosure(const ImmutableString& inName, const InterfaceRef<IZOCEnclosure>& inEnclosure) {
        ostcore::threads::ScopedLock lock(IZOCDataServer::GetLock(),
                                          "ServerResourceWithEnclosures::AddEnclosure");
        mEnclosures[inName] = inEnclosure;
    }

protected:
    void PostLoadDTO() override {
        std::map<ImmutableString, InterfaceRef<IZOCEnclosure>> former;
        ostcore::threads::ScopedLock lock(IZOCDataServer::GetLock(),
                                          "ServerResourceWithEnclosures::PostLoadDTO");
        mEnclosures.swap(former);
    }

private:
    std::map<ImmutableString, InterfaceRef<IZOCEnclosure>> mEnclosures
        ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

/// The enclosures of a production, an asset or a user.
class Enclosures final : public ServerResourceWithEnclosures<JSONServerResource<dto::ContainedEnclosures>> {};

}  // namespace ZOCL
