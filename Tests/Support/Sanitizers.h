#pragma once

// 1 in a build with the sanitizer. GCC tells of its sanitizers by macros, Clang by features.
#if defined(__has_feature)
#define COMPILER_HAS_FEATURE(name) __has_feature(name)
#else
#define COMPILER_HAS_FEATURE(name) 0
#endif
#if defined(__SANITIZE_ADDRESS__) || COMPILER_HAS_FEATURE(address_sanitizer)
#define WITH_ADDRESS_SANITIZER 1
#else
#define WITH_ADDRESS_SANITIZER 0
#endif
#if defined(__SANITIZE_THREAD__) || COMPILER_HAS_FEATURE(thread_sanitizer)
#define WITH_THREAD_SANITIZER 1
#else
#define WITH_THREAD_SANITIZER 0
#endif
