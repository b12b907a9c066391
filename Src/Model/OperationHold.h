// Keeps a compound operation from ending until somebody lets it go.
#pragma once

#include "ZOClient/CompoundAsyncOperation.h"

namespace ZOCL {

/// One request of the operation that sends nothing. It ends with the first of: Release, the failure of the
/// operation (then it lets itself go), or the end of the last reference to it.
/// Threads: any; no lock may be held, since letting go can end the operation.
class OperationHold {
public:
    /// On an operation that has failed already, the hold is none.
    static shared_ptr<OperationHold> Take(const shared_ptr<CompoundAsyncOperation>& inOperation);
    OperationHold() = default;
    ~OperationHold();
    OperationHold(const OperationHold&) = delete;
    OperationHold& operator=(const OperationHold&) = delete;

    void Release(int inResult);

private:
    struct Ticket;
    shared_ptr<Ticket> mTicket;
};

}  // namespace ZOCL
