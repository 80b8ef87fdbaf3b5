#pragma once

/// BASE1_API marks what the core library base1 exports; everything else stays hidden.
#if defined(_WIN32)
#  if defined(BASE1_BUILDING)
#    define BASE1_API __declspec(dllexport)
#  else
#    define BASE1_API __declspec(dllimport)
#  endif
#else
#  define BASE1_API __attribute__((visibility("default")))
#endif
