// Writes an answer as a fault plan has it: a part of it, slowly, or something else.
#pragma once

#include <algorithm>
#include <boost/asio/steady_timer.hpp>
#include <boost/asio/write.hpp>
#include <boost/beast/core/error.hpp>
#include <functional>
#include <memory>

#include "Http/FaultPlan.h"

namespace zohub {

/// What the connection does next.
enum class AfterFault { GoOn, Close, Reset };

template <class Stream>
class FaultySender : public std::enable_shared_from_this<FaultySender<Stream>> {
public:
    using EndFunction = std::function<void(AfterFault)>;

    /// The end function keeps the stream alive. It is called once, on the stream's executor.
    FaultySender(Stream& ioStream, boost::asio::steady_timer& ioTimer, std::string const& inHead,
                 std::string const& inBody, FaultPlan const& inPlan, EndFunction inOnEnd)
        : mStream(ioStream),
          mTimer(ioTimer),
          mBytes(inPlan.ending == FaultPlan::Ending::Garbage ? kGarbage : inHead + inBody),
          mPlan(inPlan),
          mOnEnd(std::move(inOnEnd)) {
        mLimit = mBytes.size();
        if (inPlan.ending == FaultPlan::Ending::Drop)
            mLimit = 0;
        if (IsCut())
            mLimit = inBody.empty() ? inHead.size() - 1 : inHead.size() + CutIn(inBody.size());
    }

    void Step() {
        if (mWritten >= mLimit)
            return Finish();
        bool const isTrickle = mPlan.ending == FaultPlan::Ending::Trickle;
        std::size_t const left = mLimit - mWritten;
        std::size_t const count = isTrickle ? std::min(mPlan.piece, left) : left;
        boost::asio::async_write(
            mStream, boost::asio::buffer(mBytes.data() + mWritten, count),
            [self = this->shared_from_this(), count](boost::beast::error_code inError, std::size_t) {
                self->OnWritten(inError, count);
            });
    }

private:
    static constexpr char kGarbage[] = "\x16\x03\x01 no answer of any hub \xff\xfe\r\n<html>\r\n\r\n";

    bool IsCut() const {
        return mPlan.ending == FaultPlan::Ending::Reset || mPlan.ending == FaultPlan::Ending::Truncate ||
               mPlan.ending == FaultPlan::Ending::Stall;
    }
    // Something is always missing.
    std::size_t CutIn(std::size_t inBody) const {
        return std::min(mPlan.cutAt.value_or(inBody / 2), inBody - 1);
    }

    void OnWritten(boost::beast::error_code inError, std::size_t inCount) {
        if (inError)
            return mOnEnd(AfterFault::Close);
        mWritten += inCount;
        if (mPlan.ending != FaultPlan::Ending::Trickle || mWritten >= mLimit)
            return Step();
        Wait([self = this->shared_from_this()] { self->Step(); });
    }

    void Finish() {
        switch (mPlan.ending) {
            case FaultPlan::Ending::Whole:
            case FaultPlan::Ending::Trickle:
                return mOnEnd(AfterFault::GoOn);
            case FaultPlan::Ending::Drop:
            case FaultPlan::Ending::Reset:
                return mOnEnd(AfterFault::Reset);
            case FaultPlan::Ending::Stall:
                return Wait([self = this->shared_from_this()] { self->mOnEnd(AfterFault::Reset); });
            case FaultPlan::Ending::Truncate:
            case FaultPlan::Ending::Garbage:
                return mOnEnd(AfterFault::Close);
        }
    }

    template <class Function>
    void Wait(Function inThen) {
        mTimer.expires_after(mPlan.pause);
        mTimer.async_wait(
            [self = this->shared_from_this(), then = std::move(inThen)](boost::beast::error_code inError) {
                if (inError)
                    return self->mOnEnd(AfterFault::Close);
                then();
            });
    }

    Stream& mStream;
    boost::asio::steady_timer& mTimer;
    std::string const mBytes;
    FaultPlan const mPlan;
    EndFunction const mOnEnd;
    std::size_t mLimit = 0;
    std::size_t mWritten = 0;
};

}  // namespace zohub
