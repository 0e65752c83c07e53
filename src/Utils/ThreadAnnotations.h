// SPDX-License-Identifier: Apache-2.0
#pragma once

/// Clang's thread-safety annotations; empty where the compiler does not know them.
/// A class marked QUENX_CAPABILITY is a lock, one marked QUENX_SCOPED_CAPABILITY holds a lock for its scope.

#if defined(__clang__)
#define QUENX_THREAD_ANNOTATION(x) __attribute__((x))
#else
#define QUENX_THREAD_ANNOTATION(x)
#endif

#define QUENX_CAPABILITY(x) QUENX_THREAD_ANNOTATION(capability(x))
#define QUENX_SCOPED_CAPABILITY QUENX_THREAD_ANNOTATION(scoped_lockable)
#define QUENX_GUARDED_BY(x) QUENX_THREAD_ANNOTATION(guarded_by(x))
#define QUENX_PT_GUARDED_BY(x) QUENX_THREAD_ANNOTATION(pt_guarded_by(x))
#define QUENX_REQUIRES(...) QUENX_THREAD_ANNOTATION(requires_capability(__VA_ARGS__))
#define QUENX_ACQUIRE(...) QUENX_THREAD_ANNOTATION(acquire_capability(__VA_ARGS__))
#define QUENX_TRY_ACQUIRE(...) QUENX_THREAD_ANNOTATION(try_acquire_capability(__VA_ARGS__))
#define QUENX_RELEASE(...) QUENX_THREAD_ANNOTATION(release_capability(__VA_ARGS__))
#define QUENX_EXCLUDES(...) QUENX_THREAD_ANNOTATION(locks_excluded(__VA_ARGS__))
#define QUENX_RETURN_CAPABILITY(x) QUENX_THREAD_ANNOTATION(lock_returned(x))
#define QUENX_NO_THREAD_SAFETY_ANALYSIS QUENX_THREAD_ANNOTATION(no_thread_safety_analysis)
