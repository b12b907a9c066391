// The orders of a worker, over the public interface of the library.
#include "Worker.h"

#include <malloc.h>

#include <iostream>
#include <map>
#include <nlohmann/json.hpp>

#include "Host.h"
#include "ostcore/utility/StringConversion.h"
#include "Payload.h"
#include "ZOClient/IZOCDifferences.h"
#include "ZOClient/IZOCEditingSession.h"
#include "ZOClient/IZOCProduction.h"
#include "ZOClient/IZOCProductionHistory.h"
#include "ZOClient/IZOCTransaction.h"

namespace campaign {

namespace {

using nlohmann::json;
using ostcore::utility::RecycledMemory;
using ostcore::utility::ToUTF16;
using ostcore::utility::ToUTF8;
using ZOCL::IZOCAsset;
using ZOCL::IZOCAssetList;
using ZOCL::IZOCDifferences;
using ZOCL::IZOCEditingSession;
using ZOCL::IZOCEnclosure;
using ZOCL::IZOCEnclosures;
using ZOCL::IZOCProduction;
using ZOCL::IZOCProductionHistory;
using ZOCL::IZOCTransaction;
using ZOCL::IZOCWritableAsset;
using ZOCL::RequestCompletion;

/// A step that did not succeed, with its result; the order ends with it.
struct StepFailure {
    std::string step;
    int result;
};

ZOCL::shared_ptr<RecycledMemory const> Memory(const std::string& inBytes) {
    return RecycledMemory::CreateFromBytes(inBytes);
}

std::string TextOf(const ZOCL::shared_ptr<RecycledMemory const>& inMemory) {
    return inMemory ? std::string(inMemory->view()) : std::string();
}

class Worker {
public:
    /// The reply; throws StepFailure.
    json Do(const json& inOrder) {
        using Order = json (Worker::*)(const json&);
        static const std::map<std::string, Order> kOrders = {
            {"connect", &Worker::Connect},     {"create", &Worker::Create}, {"open", &Worker::Open},
            {"edit", &Worker::Edit},           {"pull", &Worker::Pull},     {"share", &Worker::Share},
            {"conflicts", &Worker::Conflicts}, {"accept", &Worker::Accept}, {"history", &Worker::History},
            {"look", &Worker::Look},           {"close", &Worker::Close},   {"counts", &Worker::Counts}};
        return (this->*kOrders.at(inOrder.at("do").get<std::string>()))(inOrder);
    }

private:
    json Connect(const json& inOrder) {
        const int result = mHost.Connect(inOrder.at("server"), inOrder.at("user"), inOrder.at("password"));
        if (result < 0) {
            throw StepFailure{"connect", result};
        }
        return json::object();
    }

    json Create(const json& inOrder) {
        const Ended ended = Must("create", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return mHost.Server()->CreateProduction(inID, ToUTF16(inOrder.at("name").get<std::string>()), u"",
                                                    false, inEnd);
        });
        return {{"production", ended.resource->GetHTTPURL().str()}};
    }

    json Open(const json& inOrder) {
        const ImmutableString url(inOrder.at("production").get<std::string>());
        const Ended ended = Must("load", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return mHost.Server()->LoadProductionFromURL(url, inID, inEnd);
        });
        mProduction = RFL::QueryInterface<IZOCProduction>(ended.resource);
        mSession.Reset();
        const bool isThere = mProduction && mProduction->CreateEditingSession(mSession, u"work", u"", false);
        if (!isThere || !mSession) {
            throw StepFailure{"session", ZOCL::kResultFailure};
        }
        return {{"session", SessionResource()->GetHTTPURL().str()}};
    }

    json Close(const json&) {
        mSession.Reset();
        mProduction.Reset();
        return json::object();
    }

    // --- Writing.

    json Edit(const json& inOrder) {
        RefreshSession();
        const Ended opened = Must("begin", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return mSession->CreateTransaction(inID, inEnd, ZOCL::kTransactionType_Edit);
        });
        const auto transaction = RFL::QueryInterface<IZOCTransaction>(opened.resource);
        try {
            Fill(transaction, inOrder);
        } catch (const StepFailure&) {
            mHost.Run([&](const Guid& inID, const RequestCompletion& inEnd) {
                return transaction->Rollback(inID, inEnd);
            });
            throw;
        }
        Must("commit", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return transaction->Commit(inID, inEnd, ToUTF16(inOrder.at("message").get<std::string>()));
        });
        return json::object();
    }

    void Fill(const InterfaceRef<IZOCTransaction>& inTransaction, const json& inOrder) {
        for (const json& asset : inOrder.value("add", json::array())) {
            Add(inTransaction, asset);
        }
        for (const json& change : inOrder.value("change", json::array())) {
            Change(inTransaction, change);
        }
        for (const json& note : inOrder.value("notes", json::array())) {
            Must("note", [&](const Guid& inID, const RequestCompletion& inEnd) {
                return inTransaction->WriteEnclosure(ImmutableString(note.at("name").get<std::string>()),
                                                     note.at("text"), inID, inEnd,
                                                     ImmutableString("text/plain"));
            });
        }
    }

    void Add(const InterfaceRef<IZOCTransaction>& inTransaction, const json& inAsset) {
        ZOCL::AssetBaseProperties properties;
        properties.name = ToUTF16(inAsset.at("name").get<std::string>());
        properties.description = ToUTF16(inAsset.at("description").get<std::string>());
        properties.assetType = ZOCL::kAssetType_MasterClip;
        const Ended added = Must("add", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return inTransaction->CreateNewAsset(inID, inEnd, properties);
        });
        const auto asset = RFL::QueryInterface<IZOCWritableAsset>(added.resource);
        for (const json& enclosure : inAsset.at("enclosures")) {
            const std::string name = enclosure.at("name");
            Must("enclose", [&](const Guid& inID, const RequestCompletion& inEnd) {
                return ZOCL::CreateEnclosure(inID, asset->GetEnclosureFactoryURL(), mHost.Server(),
                                             ImmutableString(name),
                                             Memory(PayloadOf(name, enclosure.at("size"))), inEnd);
            });
        }
    }

    void Change(const InterfaceRef<IZOCTransaction>& inTransaction, const json& inChange) {
        const auto list = RFL::QueryInterface<IZOCProduction>(inTransaction)->GetAssets();
        LoadFresh("list", RFL::QueryInterface<IZOCServerResource>(list));
        const auto asset = list->GetAssetByName(ToUTF16(inChange.at("name").get<std::string>()));
        const auto writable = RFL::QueryInterface<IZOCWritableAsset>(asset);
        if (!writable) {
            throw StepFailure{"find", ZOCL::kResultFailure};
        }
        ZOCL::AssetBaseProperties properties = asset->GetAssetBaseProperties();
        properties.description = ToUTF16(inChange.at("description").get<std::string>());
        Must("change", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return writable->SetAssetBasePropertiesAndUpdate(properties, inID, inEnd);
        });
    }

    // --- The team.

    json Pull(const json& inOrder) {
        RefreshSession();
        Must("pull", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return mSession->Pull(inID, inEnd, inOrder.at("strategy"), u"");
        });
        return json::object();
    }

    json Share(const json& inOrder) {
        RefreshSession();
        const ImmutableString head = RFL::QueryInterface<IZOCProduction>(mSession)->GetLoadedRevision();
        Must("share", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return mSession->Push(inID, inEnd, ToUTF16(inOrder.at("message").get<std::string>()),
                                  ZOCL::kResolveStrategy_None, ToUTF16(head.str()));
        });
        return json::object();
    }

    json Conflicts(const json&) {
        RefreshSession();
        const auto outgoing = mSession->GetOutgoingChanges();
        LoadFresh("outgoing", RFL::QueryInterface<IZOCServerResource>(outgoing));
        json entries = json::array();
        const auto append = [&entries](const std::vector<IZOCDifferences::Entry>& inEntries) {
            for (const auto& entry : inEntries) {
                if (entry.IsInConflict()) {
                    entries.push_back({{"name", entry.name.str()},
                                       {"theirs", entry.acceptTheirsURL.str()},
                                       {"yours", entry.acceptYoursURL.str()}});
                }
            }
        };
        append(outgoing->GetAssetDifferences());
        append(outgoing->GetEnclosureDifferences());
        return {{"conflicts", entries}, {"commit", outgoing->GetCommitID().str()}};
    }

    json Accept(const json& inOrder) {
        const json body = {{":commitId", inOrder.at("commit")}};
        Must("accept", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return mHost.Server()->PostToURL(ImmutableString(inOrder.at("url").get<std::string>()),
                                             Memory(body.dump()),
                                             ImmutableString("application/json;charset=utf-8"), inID, inEnd);
        });
        return json::object();
    }

    json History(const json&) {
        json titles = json::array();
        for (auto page = mProduction->GetProductionHistory(); page; page = page->GetNextPage()) {
            LoadFresh("history", RFL::QueryInterface<IZOCServerResource>(page));
            for (int i = 0; i < page->GetHistoryVersionCount(); ++i) {
                ZOCL::UString date, user, title, message, revision;
                page->GetHistoryVersion(i)->GetInfo(date, user, title, message, revision);
                titles.push_back(ToUTF8(title));
            }
        }
        return {{"titles", titles}};
    }

    /// All that the session holds, as this client sees it.
    json Look(const json&) {
        RefreshSession();
        const auto session = RFL::QueryInterface<IZOCProduction>(mSession);
        const auto list = session->GetAssets();
        LoadFresh("assets", RFL::QueryInterface<IZOCServerResource>(list));
        json assets = json::array();
        for (const auto& item : list->GetAllItems()) {
            const auto asset = list->GetAssetByIdentifier(item.assetIdentifier);
            if (!asset) {
                throw StepFailure{"asset", ZOCL::kResultFailure};
            }
            assets.push_back({{"name", ToUTF8(item.name)},
                              {"description", ToUTF8(item.description)},
                              {"enclosures", LookInto(asset->GetEnclosures())}});
        }
        return {{"assets", assets}, {"enclosures", LookInto(session->GetEnclosures())}};
    }

    json LookInto(const InterfaceRef<IZOCEnclosures>& inEnclosures) {
        LoadFresh("enclosures", RFL::QueryInterface<IZOCServerResource>(inEnclosures));
        Must("payloads", [&](const Guid& inID, const RequestCompletion& inEnd) {
            return ZOCL::LoadAllEnclosures(inEnclosures, inID, inEnd);
        });
        json contents = json::object();
        for (const ImmutableString& name : inEnclosures->GetEnclosureNames()) {
            contents[name.str()] = DigestOf(TextOf(inEnclosures->GetEnclosure(name)->GetEnclosurePayload()));
        }
        return contents;
    }

    json Counts(const json&) {
        const struct mallinfo2 heap = mallinfo2();
        const CallCounts counts = mHost.Counts();
        return {{"started", counts.started},
                {"ended", counts.ended},
                {"endedAgain", counts.endedAgain},
                {"allocated", heap.uordblks + heap.hblkhd},
                {"wasEnded", mHost.WasEnded()}};
    }

    // --- Helpers.

    InterfaceRef<IZOCServerResource> SessionResource() const {
        return RFL::QueryInterface<IZOCServerResource>(mSession);
    }
    Ended Must(const char* inStep, const Host::Start& inStart) {
        const Ended ended = mHost.Run(inStart);
        if (!ended.Succeeded()) {
            throw StepFailure{inStep, ended.result};
        }
        return ended;
    }
    void RefreshSession() { LoadFresh("refresh", SessionResource()); }
    void LoadFresh(const char* inStep, const InterfaceRef<IZOCServerResource>& inResource) {
        if (!inResource) {
            throw StepFailure{inStep, ZOCL::kResultInterfaceNotSupported};
        }
        const Ended ended = mHost.Run([&](const Guid& inID, const RequestCompletion& inEnd) {
            return inResource->IsLoaded() ? inResource->Refresh(inID, inEnd)
                                          : inResource->Load(inID, inEnd, false);
        });
        if (!ended.Succeeded() && ended.result != ZOCL::kResultHTTPNotModified) {
            throw StepFailure{inStep, ended.result};
        }
        if (!inResource->IsLoaded()) {
            throw StepFailure{inStep, ZOCL::kResultFailure};
        }
    }

    Host mHost;
    InterfaceRef<IZOCProduction> mProduction;
    InterfaceRef<IZOCEditingSession> mSession;
};

json Obey(Worker& ioWorker, const json& inOrder) {
    json reply;
    try {
        reply = ioWorker.Do(inOrder);
        reply["result"] = 0;
    } catch (const StepFailure& failure) {
        reply = {{"result", failure.result},
                 {"step", failure.step},
                 {"name", ZOCL::GetResultName(failure.result)}};
    } catch (const std::exception& error) {
        reply = {{"result", ZOCL::kResultFailure}, {"step", "exception"}, {"name", error.what()}};
    }
    return reply;
}

}  // namespace

int RunWorker() {
    Worker worker;
    std::string line;
    while (std::getline(std::cin, line)) {
        const json order = json::parse(line);
        if (order.at("do") == "quit") {
            break;
        }
        std::cout << Obey(worker, order).dump() << std::endl;
    }
    return 0;
}

}  // namespace campaign
