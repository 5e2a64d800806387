// Export control for the OWUtils shared library.
//
// The library is built with hidden symbol visibility; only what is marked with OWUTILS_API is
// exported. Mark the exported functions and every public class with it (exception classes in
// particular: their type information must be shared with client programs so that a throw inside
// the library is caught by type outside it).
#pragma once

#if defined(_WIN32)
#  if defined(OWUTILS_BUILDING)
#    define OWUTILS_API __declspec(dllexport)
#  elif defined(OWUTILS_STATIC)
#    define OWUTILS_API
#  else
#    define OWUTILS_API __declspec(dllimport)
#  endif
#else
#  define OWUTILS_API __attribute__((visibility("default")))
#endif
