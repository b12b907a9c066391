// The items of one kind that wait to be sent in bulk, and those of them that went into one form.
#pragma once

#include "Model/BulkAnswer.h"
#include "Model/BulkForm.h"

namespace ZOCL {

/// The items that one request carries. Ended exactly once, with no lock held.
class BulkBatch {
public:
    virtual ~BulkBatch() = default;
    virtual bool ReadsAnswer() const = 0;
    /// Whether the answer speaks of no more than the form held.
    virtual bool Fits(const BulkAnswer& inAnswer) const = 0;
    virtual void Complete(int inResult, const BulkAnswer& inAnswer) = 0;
};

class BulkPending {
public:
    virtual ~BulkPending() = default;
    virtual bool IsEmpty() const = 0;
    /// Moves items into the form until it is full or none is left. What has nothing to write is of the batch
    /// as well.
    virtual shared_ptr<BulkBatch> MoveInto(BulkForm& ioForm) = 0;
    /// Those that no form would take; null when there are none.
    virtual shared_ptr<BulkBatch> TakeRefused() = 0;
    /// All that are left.
    virtual shared_ptr<BulkBatch> TakeRest() = 0;
};

/// How items of a kind are written and ended. Without fits, the answer is not looked at.
template <class Item>
struct BulkKind {
    function<BulkWritten(BulkForm& ioForm, std::size_t inIndex, const Item& inItem)> write;
    function<bool(const std::vector<Item>& inSent, const BulkAnswer& inAnswer)> fits;
    function<void(int inResult, const BulkAnswer& inAnswer, std::vector<Item>& ioItems)> complete;
};

template <class Item>
class BulkItemBatch final : public BulkBatch {
public:
    explicit BulkItemBatch(const BulkKind<Item>& inKind) : mKind(inKind) {}

    std::vector<Item> sent;
    std::vector<Item> unsent;

    bool ReadsAnswer() const override { return bool(mKind.fits); }
    bool Fits(const BulkAnswer& inAnswer) const override { return !mKind.fits || mKind.fits(sent, inAnswer); }
    void Complete(int inResult, const BulkAnswer& inAnswer) override {
        mKind.complete(inResult, inAnswer, sent);
        mKind.complete(inResult, BulkAnswer(), unsent);
    }

private:
    const BulkKind<Item> mKind;
};

template <class Item>
class BulkItems final : public BulkPending {
public:
    BulkItems(std::vector<Item> inItems, const BulkKind<Item>& inKind)
        : mItems(std::move(inItems)), mKind(inKind) {}

    bool IsEmpty() const override { return mNext == mItems.size(); }

    shared_ptr<BulkBatch> MoveInto(BulkForm& ioForm) override {
        const auto batch = boost::make_shared<BulkItemBatch<Item>>(mKind);
        for (; !IsEmpty() && !ioForm.IsFull(); ++mNext) {
            Item& item = mItems[mNext];
            const BulkWritten written = mKind.write(ioForm, batch->sent.size(), item);
            auto& destination = written == BulkWritten::kWritten   ? batch->sent
                                : written == BulkWritten::kNothing ? batch->unsent
                                                                   : mRefused;
            destination.push_back(std::move(item));
        }
        return batch;
    }

    shared_ptr<BulkBatch> TakeRefused() override {
        if (mRefused.empty()) {
            return nullptr;
        }
        const auto batch = boost::make_shared<BulkItemBatch<Item>>(mKind);
        batch->unsent.swap(mRefused);
        return batch;
    }

    shared_ptr<BulkBatch> TakeRest() override {
        const auto batch = boost::make_shared<BulkItemBatch<Item>>(mKind);
        batch->unsent.assign(std::make_move_iterator(mItems.begin() + static_cast<std::ptrdiff_t>(mNext)),
                             std::make_move_iterator(mItems.end()));
        mNext = mItems.size();
        return batch;
    }

private:
    std::vector<Item> mItems;
    std::size_t mNext = 0;
    std::vector<Item> mRefused;
    const BulkKind<Item> mKind;
};

}  // namespace ZOCL
