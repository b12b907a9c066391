# The install tree: libraries, headers, the CMake package, pkg-config files, the programs and their manuals.
include(CMakePackageConfigHelpers)

set(zo_include_dir ${CMAKE_INSTALL_INCLUDEDIR}/zoclient)
set(zo_package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/ZOClient)

set(zo_libraries ZOClient ZOClientPlatform)
if(TARGET ZOClientTesting)
  list(APPEND zo_libraries ZOClientTesting)
endif()
# Next to one another, so that an installation can be moved as a whole.
set_target_properties(${zo_libraries} PROPERTIES INSTALL_RPATH "$ORIGIN")
install(TARGETS ${zo_libraries} EXPORT ZOClientTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  INCLUDES DESTINATION ${zo_include_dir})
install(EXPORT ZOClientTargets NAMESPACE ZOClient:: DESTINATION ${zo_package_dir})

install(DIRECTORY ${PROJECT_SOURCE_DIR}/API/Inc/ DESTINATION ${zo_include_dir}
  FILES_MATCHING PATTERN "*.h" PATTERN "ZOClientQt" EXCLUDE)
if(TARGET ZOClientQt)
  # A component of its own, find_package(ZOClient COMPONENTS Qt), so that other hosts never look at it.
  set_target_properties(ZOClientQt PROPERTIES INSTALL_RPATH "$ORIGIN")
  install(TARGETS ZOClientQt EXPORT ZOClientQtTargets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
    INCLUDES DESTINATION ${zo_include_dir})
  install(EXPORT ZOClientQtTargets NAMESPACE ZOClient:: DESTINATION ${zo_package_dir})
  install(DIRECTORY ${PROJECT_SOURCE_DIR}/API/Inc/ZOClientQt DESTINATION ${zo_include_dir} FILES_MATCHING PATTERN "*.h")
endif()
install(DIRECTORY ${PROJECT_SOURCE_DIR}/Platform/ DESTINATION ${zo_include_dir}
  FILES_MATCHING PATTERN "*.h" PATTERN "detail" EXCLUDE)

configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/ZOClientConfig.cmake.in
  ${PROJECT_BINARY_DIR}/ZOClientConfig.cmake INSTALL_DESTINATION ${zo_package_dir})
write_basic_package_version_file(${PROJECT_BINARY_DIR}/ZOClientConfigVersion.cmake COMPATIBILITY SameMinorVersion)
install(FILES ${PROJECT_BINARY_DIR}/ZOClientConfig.cmake ${PROJECT_BINARY_DIR}/ZOClientConfigVersion.cmake
  DESTINATION ${zo_package_dir})

foreach(name zoclient zoclient-testing)
  configure_file(${PROJECT_SOURCE_DIR}/Packaging/${name}.pc.in ${PROJECT_BINARY_DIR}/${name}.pc @ONLY)
  install(FILES ${PROJECT_BINARY_DIR}/${name}.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
endforeach()

# The hub installs itself: it shares nothing with the client.
set_target_properties(zo PROPERTIES INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
install(TARGETS zo RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})

if(TARGET zo_documents)
  install(DIRECTORY ${PROJECT_BINARY_DIR}/share/man/ DESTINATION ${CMAKE_INSTALL_MANDIR})
  foreach(folder bash-completion zsh fish)
    install(DIRECTORY ${PROJECT_BINARY_DIR}/share/${folder} DESTINATION ${CMAKE_INSTALL_DATADIR})
  endforeach()
endif()
