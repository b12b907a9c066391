// Fills one bulk transaction and waits for the end of the operation that it is part of.
#include "BulkSend.h"

#include <mutex>

namespace zo {
namespace {

using ZOCL::CompoundAsyncOperation;

// The completions come on workers, and when the network is given up also after this program has gone on.
struct Answers {
    std::mutex mutex;
    std::vector<std::string> ids;
};

void Fill(const ZOCL::InterfaceRef<ZOCL::IZOCBulkTransaction>& inBulk,
          const std::vector<ZOCL::BulkNewAsset>& inAssets, const std::vector<EnclosureEdit>& inEdits,
          const std::shared_ptr<Answers>& inAnswers) {
    for (std::size_t i = 0; i < inAssets.size(); ++i) {
        inBulk->CreateNewAsset(
            [inAnswers, i](int, const ZOCL::InterfaceRef<ZOCL::IZOCAsset>& inAsset) {
                const std::string id = inAsset ? inAsset->GetAssetIdentifier().str() : std::string();
                const std::lock_guard<std::mutex> lock(inAnswers->mutex);
                inAnswers->ids[i] = id;
            },
            inAssets[i]);
    }
    for (const EnclosureEdit& edit : inEdits) {
        inBulk->SetAssetEnclosure({}, ZOCL::ImmutableString(edit.assetID), edit.name, edit.data);
    }
    inBulk->FinishedEditing();
}

}  // namespace

BulkOutcome SendInBulk(Context& ioContext, const OpenTransaction& inTransaction, const std::string& inWhat,
                       const std::vector<ZOCL::BulkNewAsset>& inAssets,
                       const std::vector<EnclosureEdit>& inEdits) {
    const auto answers = std::make_shared<Answers>();
    answers->ids.resize(inAssets.size());
    const auto server = ioContext.Server();
    boost::shared_ptr<CompoundAsyncOperation> operation;
    BulkOutcome bulk;
    const Outcome outcome = ioContext.Loop().Run(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            operation = CompoundAsyncOperation::Create(
                [inRequest, inCompletion](int inResult) {
                    inCompletion(inRequest, inResult, nullptr, nullptr);
                },
                server, false);
            const auto transaction = inTransaction.transaction->CreateBulkTransaction(operation);
            bulk.isOffered = static_cast<bool>(transaction);
            if (transaction) {
                Fill(transaction, inAssets, inEdits, answers);
            }
            return bulk.isOffered;
        },
        [&operation](const ZOCL::Guid&) { operation->TryToCancel(); });
    if (bulk.isOffered && !outcome.Succeeded()) {
        const Failure failure = Failure::OfRequest(inWhat, outcome.result, outcome.response);
        if (failure.Code() == ExitCode::Failure) {
            throw BulkRefused(failure);
        }
        throw Failure(failure);
    }
    const std::lock_guard<std::mutex> lock(answers->mutex);
    bulk.ids = answers->ids;
    return bulk;
}

}  // namespace zo
