#pragma once

namespace velkor::testing {

/// Whether a sanitizer of GCC or Clang is at work, which makes everything several times larger and
/// slower.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool isSanitized = true;
#elif defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
constexpr bool isSanitized = true;
#else
constexpr bool isSanitized = false;
#endif
#else
constexpr bool isSanitized = false;
#endif

/// Whether the thread sanitizer is.
#if defined(__SANITIZE_THREAD__)
constexpr bool isThreadSanitized = true;
#elif defined(__has_feature)
#if __has_feature(thread_sanitizer)
constexpr bool isThreadSanitized = true;
#else
constexpr bool isThreadSanitized = false;
#endif
#else
constexpr bool isThreadSanitized = false;
#endif

}  // namespace velkor::testing
