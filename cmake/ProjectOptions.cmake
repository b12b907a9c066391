# Switches of the build and the settings that every target shares.
option(ZO_BUILD_TESTS "Build the tests" ON)
option(ZO_BUILD_BENCHMARKS "Build the benchmarks" OFF)
option(ZO_BUILD_FUZZERS "Build the libFuzzer targets (clang only)" OFF)
option(ZO_WARNINGS_AS_ERRORS "Treat warnings as errors" ON)
option(ZO_THREAD_SAFETY_ANALYSIS "Check the lock annotations (clang only)" OFF)
set(ZO_SANITIZE "" CACHE STRING "Sanitizers, comma separated: address,undefined or thread")

set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/bin)
set(CMAKE_LIBRARY_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/lib)
set(CMAKE_ARCHIVE_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/lib)
set(CMAKE_DEPENDS_USE_COMPILER ON)

find_program(ZO_CCACHE ccache)
if(ZO_CCACHE AND NOT CMAKE_CXX_COMPILER_LAUNCHER)
  # The sloppiness is what ccache needs to work with precompiled headers.
  set(CMAKE_CXX_COMPILER_LAUNCHER
      ${CMAKE_COMMAND} -E env CCACHE_SLOPPINESS=pch_defines,time_macros,include_file_mtime,include_file_ctime
      ${ZO_CCACHE})
endif()

find_program(ZO_MOLD mold)
if(ZO_MOLD)
  add_link_options(-fuse-ld=mold)
endif()

if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  add_compile_options(-fpch-preprocess)
endif()

if(ZO_SANITIZE)
  add_compile_options(-fsanitize=${ZO_SANITIZE} -fno-omit-frame-pointer)
  add_link_options(-fsanitize=${ZO_SANITIZE})
  if(CMAKE_CXX_COMPILER_ID MATCHES "Clang")
    # gcc says so by itself.
    if(ZO_SANITIZE MATCHES "address")
      add_compile_definitions(__SANITIZE_ADDRESS__=1)
    elseif(ZO_SANITIZE MATCHES "thread")
      add_compile_definitions(__SANITIZE_THREAD__=1)
    endif()
  endif()
  if(ZO_SANITIZE MATCHES "undefined")
    add_compile_options(-fno-sanitize-recover=undefined)
    if(CMAKE_CXX_COMPILER_ID MATCHES "Clang")
      add_compile_options(-fno-sanitize=function)  # what clang 14 writes for it its own assembler refuses
    endif()
  endif()
endif()

if(ZO_BUILD_FUZZERS)
  # The libraries under test report their coverage, not only the fuzzer's own source.
  add_compile_options(-fsanitize=fuzzer-no-link)
endif()

add_compile_definitions(BOOST_BIND_GLOBAL_PLACEHOLDERS)

find_package(Threads REQUIRED)
find_package(Boost 1.81 REQUIRED)
find_package(SQLite3 REQUIRED)
find_package(OpenSSL REQUIRED)
find_package(CURL REQUIRED)
find_package(ZLIB REQUIRED)
