// Starts threads that leave the host's signals to the host.
#pragma once

#include <pthread.h>

#include <csignal>
#include <thread>
#include <utility>

namespace ostnet {
namespace http {

/// A thread with all signals blocked: a host's handlers never run on it, and a broken pipe does not end the
/// process.
template <typename Function>
std::thread StartThread(Function inFunction) {
    sigset_t all, former;
    sigfillset(&all);
    pthread_sigmask(SIG_SETMASK, &all, &former);
    try {
        std::thread thread(std::move(inFunction));
        pthread_sigmask(SIG_SETMASK, &former, nullptr);
        return thread;
    } catch (...) {
        pthread_sigmask(SIG_SETMASK, &former, nullptr);
        throw;
    }
}

}  // namespace http
}  // namespace ostnet
