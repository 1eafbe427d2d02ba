#pragma once

// Marks what the shared library exports; everything else has hidden visibility.
#define XQUERY_EXPORT __attribute__((visibility("default")))
