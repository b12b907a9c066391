# The Qt 6 back end for windows, in a library of its own; left out where Qt is missing.
option(ZO_BUILD_QT "Build the Qt 6 back end for windows, its tests and pictures" ON)

set(ZO_HAS_QT OFF)
if(ZO_BUILD_QT)
  find_package(Qt6 6.2 QUIET COMPONENTS Widgets Svg Test)
  if(Qt6_FOUND)
    set(ZO_HAS_QT ON)
    add_subdirectory(${PROJECT_SOURCE_DIR}/Platform/ostuiqt)
  else()
    message(STATUS "Qt 6 (Widgets, Svg, Test) was not found: libZOClientQt, its tests, pictures and benchmark "
                   "are left out; packages qt6-base-dev and qt6-svg-dev bring it")
  endif()
endif()
if(ZO_HAS_QT)
  add_subdirectory(${PROJECT_SOURCE_DIR}/Tools/dev/pictures)
endif()
