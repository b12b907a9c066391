# The floors of the house: one object library each, whose include path holds only what it may see.
#
# Src/<Floor>/X.h is included as "<Floor>/X.h". The include path of a floor is a list of folders that
# each hold one link, <Floor> -> Src/<Floor>; a floor that is not on the list cannot be included.

add_library(zo_pch OBJECT ${PROJECT_SOURCE_DIR}/cmake/Precompiled.cpp)
target_precompile_headers(zo_pch PRIVATE ${PROJECT_SOURCE_DIR}/cmake/Precompiled.h)
target_link_libraries(zo_pch PRIVATE zo_warnings Threads::Threads)

function(zo_declare_floors)
  set(visible "")
  set(declared "")
  foreach(floor IN LISTS ARGN)
    set(link_dir ${PROJECT_BINARY_DIR}/floors/${floor})
    file(MAKE_DIRECTORY ${link_dir})
    file(CREATE_LINK ${PROJECT_SOURCE_DIR}/Src/${floor} ${link_dir}/${floor} SYMBOLIC)
    list(APPEND visible ${link_dir})
    file(GLOB sources CONFIGURE_DEPENDS ${PROJECT_SOURCE_DIR}/Src/${floor}/*.cpp)
    if(NOT sources)
      continue()
    endif()
    add_library(floor_${floor} OBJECT ${sources})
    target_include_directories(floor_${floor} PRIVATE
      ${PROJECT_SOURCE_DIR}/API/Inc ${PROJECT_SOURCE_DIR}/Inc ${PROJECT_SOURCE_DIR}/Platform ${visible})
    target_precompile_headers(floor_${floor} REUSE_FROM zo_pch)
    target_link_libraries(floor_${floor} PRIVATE zo_warnings Threads::Threads)
    list(APPEND declared floor_${floor})
  endforeach()
  set(ZO_FLOOR_TARGETS ${declared} PARENT_SCOPE)
  set(ZO_FLOOR_INCLUDES ${visible} PARENT_SCOPE)
endfunction()

# All floors become libZOClient; the tests link the same objects as an archive, to reach what is hidden.
macro(zo_add_client_library)
  set(zo_floor_objects "")
  foreach(floor IN LISTS ZO_FLOOR_TARGETS)
    list(APPEND zo_floor_objects $<TARGET_OBJECTS:${floor}>)
  endforeach()
  if(zo_floor_objects)
    add_library(ZOClient SHARED ${zo_floor_objects})
    add_library(ZOClient::ZOClient ALIAS ZOClient)
    set_target_properties(ZOClient PROPERTIES
      LINKER_LANGUAGE CXX VERSION ${PROJECT_VERSION} SOVERSION ${PROJECT_VERSION_MAJOR})
    target_include_directories(ZOClient PUBLIC
      $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}/API/Inc>
      $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}/zoclient>)
    target_link_libraries(ZOClient PUBLIC ZOClientPlatform)

    add_library(zoclient_internal STATIC ${zo_floor_objects})
    set_target_properties(zoclient_internal PROPERTIES LINKER_LANGUAGE CXX)
    target_include_directories(zoclient_internal PUBLIC
      ${PROJECT_SOURCE_DIR}/API/Inc ${PROJECT_SOURCE_DIR}/Inc ${ZO_FLOOR_INCLUDES})
    target_link_libraries(zoclient_internal PUBLIC ZOClientPlatform)
  endif()
endmacro()
