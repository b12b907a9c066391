# Sources are compiled in groups of a target, so that what they include is read once a group; a clean build
# takes a third of the time. Off in the analysis preset, where each source must compile alone.
option(ZO_UNITY_BUILD "Compile the sources of a target in groups" OFF)
if(ZO_UNITY_BUILD)
  set(CMAKE_UNITY_BUILD ON)
  set(CMAKE_UNITY_BUILD_BATCH_SIZE 8)
  if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    # A class that is local to one source may hold what its unnamed namespace holds; gcc knows that only of
    # the file that it is given.
    add_compile_options(-Wno-subobject-linkage)
    # Inlining into the small buffer of boost::function makes gcc take plain copies of it for uses of
    # uninitialised bytes; the larger the group, the more it inlines.
    add_compile_options(-Wno-maybe-uninitialized)
  endif()
endif()

# Headers of Qt are dear to precompile; where sources are compiled in groups, that costs more than it saves.
function(zo_precompile_qt target)
  if(NOT ZO_UNITY_BUILD)
    target_precompile_headers(${target} PRIVATE ${ARGN})
  endif()
endfunction()

# Sources of the calling folder whose unnamed namespaces share names with their neighbours.
function(zo_compile_apart)
  set_source_files_properties(${ARGN} PROPERTIES SKIP_UNITY_BUILD_INCLUSION ON)
endfunction()
