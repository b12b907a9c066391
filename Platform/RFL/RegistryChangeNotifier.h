// Tells when a registry key was changed, by this process or another one.
#pragma once

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "RFL/Registry.h"

namespace RFL {

/// Watches one key with all that lies below it.
///
/// The callback comes on the main thread, through its queue, with no lock held. Changes that follow each
/// other closely are told once; after the last change there is always a callback that sees it. A change is
/// noticed within milliseconds as a rule and within ten seconds at the latest. Values that are written as
/// they were count as a change. The store need not exist yet.
///
/// Threads: any. After Stop (or the destructor) has returned no callback begins; on a thread other than the
/// main one, a callback that has begun may still be under way. The callback may stop and destroy its
/// notifier.
class ZOPLATFORM_EXPORT RegistryChangeNotifier {
public:
    /// Null when the path cannot be a key's, or the platform cannot watch the directory of the store. Makes
    /// the user's directory when it is missing.
    static shared_ptr<RegistryChangeNotifier> Create(RegistryRoot inRoot, const UString& inPath,
                                                     function<void()> inOnChanged);
    ~RegistryChangeNotifier();
    RegistryChangeNotifier(const RegistryChangeNotifier&) = delete;
    RegistryChangeNotifier& operator=(const RegistryChangeNotifier&) = delete;

    /// May be called more than once.
    void Stop();

private:
    struct State;
    explicit RegistryChangeNotifier(shared_ptr<State> inState);
    shared_ptr<State> mState;
};

}  // namespace RFL
