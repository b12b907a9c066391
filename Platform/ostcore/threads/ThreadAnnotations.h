// clang's thread-safety attributes under names of our own; they are empty for other compilers.
#pragma once

#if defined(__clang__)
#define ZO_THREAD_ATTRIBUTE(x) __attribute__((x))
#else
#define ZO_THREAD_ATTRIBUTE(x)
#endif

#define ZO_CAPABILITY(x) ZO_THREAD_ATTRIBUTE(capability(x))
#define ZO_SCOPED_CAPABILITY ZO_THREAD_ATTRIBUTE(scoped_lockable)
#define ZO_GUARDED_BY(x) ZO_THREAD_ATTRIBUTE(guarded_by(x))
#define ZO_PT_GUARDED_BY(x) ZO_THREAD_ATTRIBUTE(pt_guarded_by(x))
#define ZO_REQUIRES(...) ZO_THREAD_ATTRIBUTE(requires_capability(__VA_ARGS__))
#define ZO_EXCLUDES(...) ZO_THREAD_ATTRIBUTE(locks_excluded(__VA_ARGS__))
#define ZO_ACQUIRE(...) ZO_THREAD_ATTRIBUTE(acquire_capability(__VA_ARGS__))
#define ZO_RELEASE(...) ZO_THREAD_ATTRIBUTE(release_capability(__VA_ARGS__))
#define ZO_TRY_ACQUIRE(...) ZO_THREAD_ATTRIBUTE(try_acquire_capability(__VA_ARGS__))
#define ZO_RETURN_CAPABILITY(x) ZO_THREAD_ATTRIBUTE(lock_returned(x))
#define ZO_NO_THREAD_SAFETY_ANALYSIS ZO_THREAD_ATTRIBUTE(no_thread_safety_analysis)
