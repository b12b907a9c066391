# The files in Resources become bytes in a generated source, anew whenever one of them changes, comes or goes.
find_package(Python3 REQUIRED COMPONENTS Interpreter)

# zo_add_resources(TARGET TYPE=FOLDER/*.ENDING ...)
function(zo_add_resources target)
  set(arguments "")
  set(files "")
  foreach(kind IN LISTS ARGN)
    string(REPLACE "=" ";" parts ${kind})
    list(GET parts 0 type)
    list(GET parts 1 pattern)
    file(GLOB found CONFIGURE_DEPENDS ${PROJECT_SOURCE_DIR}/Resources/${pattern})
    foreach(file IN LISTS found)
      list(APPEND arguments ${type}:${file})
      list(APPEND files ${file})
    endforeach()
  endforeach()
  set(source ${PROJECT_BINARY_DIR}/generated/LibraryResources.cpp)
  file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/generated)
  add_custom_command(OUTPUT ${source}
    COMMAND ${Python3_EXECUTABLE} ${PROJECT_SOURCE_DIR}/cmake/embed_resources.py ${source} ${arguments}
    DEPENDS ${files} ${PROJECT_SOURCE_DIR}/cmake/embed_resources.py
    COMMENT "Packing the resources" VERBATIM)
  target_sources(${target} PRIVATE ${source})
endfunction()
