// Which sanitizer the code is compiled for, as gcc and clang say in different ways: 1 or 0.
#pragma once

#ifdef __has_feature
#define XQUERY_HAS_FEATURE(feature) __has_feature(feature)
#else
#define XQUERY_HAS_FEATURE(feature) 0
#endif

#if defined(__SANITIZE_ADDRESS__) || XQUERY_HAS_FEATURE(address_sanitizer)
#define XQUERY_ADDRESS_SANITIZER 1
#else
#define XQUERY_ADDRESS_SANITIZER 0
#endif

#if defined(__SANITIZE_THREAD__) || XQUERY_HAS_FEATURE(thread_sanitizer)
#define XQUERY_THREAD_SANITIZER 1
#else
#define XQUERY_THREAD_SANITIZER 0
#endif
