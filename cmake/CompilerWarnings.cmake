# One interface target carries the warnings; every target of ours links it privately.
add_library(zo_warnings INTERFACE)
target_compile_options(zo_warnings INTERFACE
  -Wall -Wextra -Wpedantic
  -Wshadow              # a shadowed member or argument hides a real mistake too often
  -Wnon-virtual-dtor    # every interface is deleted through its base somewhere
  -Wextra-semi
  -Wcast-qual           # payloads are shared as const memory
  -Wformat=2)
if(ZO_WARNINGS_AS_ERRORS)
  target_compile_options(zo_warnings INTERFACE -Werror)
endif()
if(ZO_SANITIZE AND CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  # The sanitizers' instrumentation makes gcc report these on code that is sound.
  target_compile_options(zo_warnings INTERFACE -Wno-maybe-uninitialized -Wno-tsan)
endif()
if(CMAKE_CXX_COMPILER_ID MATCHES "Clang")
  # Macros of OpenSSL cast; of those of a system's header gcc says nothing.
  target_compile_options(zo_warnings INTERFACE -Wno-cast-qual)
endif()
if(CMAKE_CXX_COMPILER_ID MATCHES "Clang" AND ZO_THREAD_SAFETY_ANALYSIS)
  target_compile_options(zo_warnings INTERFACE -Wthread-safety -Werror=thread-safety)
endif()
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU" AND CMAKE_BUILD_TYPE STREQUAL "Release")
  # gcc 12 at -O3 takes the growth of a std::string for an overflow, and the copy of the small buffer of a
  # boost::function for a use of bytes that it never wrote; the other builds keep the warnings.
  target_compile_options(zo_warnings INTERFACE -Wno-stringop-overflow -Wno-restrict -Wno-array-bounds
                                               -Wno-stringop-overread -Wno-maybe-uninitialized
                                               -Wno-uninitialized)
endif()
