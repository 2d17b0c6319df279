// Marks for functions that run inside an audio block.
#pragma once

/// Block-time function: no allocation, lock, file access or unbounded work.
/// Clang 20 and later check it; elsewhere it is documentation.
#if defined(__clang__) && defined(__has_cpp_attribute)
#if __has_cpp_attribute(clang::nonblocking)
#define TESSALY_NONBLOCKING [[clang::nonblocking]]
#endif
#endif
#ifndef TESSALY_NONBLOCKING
#define TESSALY_NONBLOCKING
#endif
