# Target header-check: every header compiles alone, except those of tests, which follow a precompiled header. A header whose
# source has the same name is the first thing that source includes (the formatter sees to it), so compiling that is the check.

function(appsync_header_check name link)
  file(GLOB_RECURSE headers CONFIGURE_DEPENDS RELATIVE "${CMAKE_SOURCE_DIR}" "${CMAKE_SOURCE_DIR}/${name}/*.h")
  foreach(header IN LISTS headers)
    string(REGEX REPLACE "\\.h$" ".cpp" source "${header}")
    if(EXISTS "${CMAKE_SOURCE_DIR}/${source}" AND NOT name STREQUAL "kit") # its sources begin with a precompiled header
      continue()
    endif()
    set(unit "${CMAKE_BINARY_DIR}/header-check/${header}.cpp")
    file(CONFIGURE OUTPUT "${unit}" CONTENT "#include \"${header}\"\n#include \"${header}\"\n")
    list(APPEND units "${unit}")
  endforeach()
  if(units)
    add_library(${name}_header_check OBJECT EXCLUDE_FROM_ALL ${units})
    target_link_libraries(${name}_header_check PRIVATE appsync_options ${link})
    target_compile_options(${name}_header_check PRIVATE -O0 -g0)
    add_dependencies(header-check ${name}_header_check)
  endif()
endfunction()

add_custom_target(header-check)
foreach(component IN LISTS APPSYNC_COMPONENTS)
  if(TARGET ${component})
    appsync_header_check(${component} ${component})
  endif()
endforeach()
