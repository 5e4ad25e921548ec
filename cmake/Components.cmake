# The components of this repository, from cmake/components.json: each top-level directory there is one library of the same
# name, of all sources below it. Includes name the component: #include "device/apps/Installer.h". What a component may
# include is checked before anything is compiled.

file(READ "${CMAKE_SOURCE_DIR}/cmake/components.json" json)
set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS "${CMAKE_SOURCE_DIR}/cmake/components.json")
string(JSON count LENGTH "${json}")
math(EXPR last "${count} - 1")
foreach(index RANGE ${last})
  string(JSON name GET "${json}" ${index} name)
  string(REGEX REPLACE "/.*" "" directory "${name}")
  list(APPEND APPSYNC_COMPONENTS "${directory}")
  string(JSON plug_in ERROR_VARIABLE absent GET "${json}" ${index} plugIn)
  if(plug_in)
    list(APPEND APPSYNC_PLUGIN_COMPONENTS "${directory}")
  endif()
endforeach()
list(REMOVE_DUPLICATES APPSYNC_COMPONENTS)

# Target component_check: fails with the includes that break a rule. Every library is compiled after it.
list(TRANSFORM APPSYNC_COMPONENTS PREPEND "${CMAKE_SOURCE_DIR}/" OUTPUT_VARIABLE roots)
foreach(root IN LISTS roots)
  list(APPEND patterns "${root}/*.h" "${root}/*.cpp")
endforeach()
file(GLOB_RECURSE checked CONFIGURE_DEPENDS ${patterns})
find_package(Python3 REQUIRED COMPONENTS Interpreter)
add_custom_command(
  OUTPUT "${CMAKE_BINARY_DIR}/components.checked"
  COMMAND Python3::Interpreter "${CMAKE_SOURCE_DIR}/cmake/components.py"
  COMMAND "${CMAKE_COMMAND}" -E touch "${CMAKE_BINARY_DIR}/components.checked"
  DEPENDS ${checked} "${CMAKE_SOURCE_DIR}/cmake/components.json" "${CMAKE_SOURCE_DIR}/cmake/components.py"
  COMMENT "Checking what components include"
  VERBATIM)
add_custom_target(component_check DEPENDS "${CMAKE_BINARY_DIR}/components.checked")

# Library NAME of KIND (STATIC or OBJECT) from the *.cpp in the directory of the same name and below, EXCLUDE (a regular
# expression) left out. LINK names what its headers and sources use. A component without sources is an INTERFACE library.
function(appsync_component name kind)
  cmake_parse_arguments(PARSE_ARGV 2 arg "" "EXCLUDE" "LINK")
  file(GLOB_RECURSE sources CONFIGURE_DEPENDS "${CMAKE_SOURCE_DIR}/${name}/*.cpp")
  if(arg_EXCLUDE)
    list(FILTER sources EXCLUDE REGEX "${arg_EXCLUDE}")
  endif()
  if(NOT sources)
    add_library(${name} INTERFACE)
    target_include_directories(${name} INTERFACE "$<BUILD_INTERFACE:${CMAKE_SOURCE_DIR}>")
    target_link_libraries(${name} INTERFACE ${arg_LINK})
    return()
  endif()
  add_library(${name} ${kind} ${sources})
  target_include_directories(${name} PUBLIC "$<BUILD_INTERFACE:${CMAKE_SOURCE_DIR}>")
  target_link_libraries(${name} PRIVATE $<BUILD_INTERFACE:appsync_options> PUBLIC ${arg_LINK})
  add_dependencies(${name} component_check)
  appsync_precompiled(${name})
  appsync_tidy(${name})
endfunction()

# The libraries of the components whose headers SOURCE includes, for programs of one file.
function(appsync_used_components source result)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS "${source}")
  file(STRINGS "${source}" includes REGEX "^#include \"[a-z]+/")
  foreach(include IN LISTS includes)
    string(REGEX REPLACE "^#include \"([a-z]+)/.*" "\\1" component "${include}")
    if(component IN_LIST APPSYNC_PLUGIN_COMPONENTS)
      list(APPEND libraries appsync_client)
    elseif(component STREQUAL "tests")
      list(APPEND libraries tests_support)
    elseif(TARGET ${component} AND NOT component MATCHES "^(bench|fuzz)$")
      list(APPEND libraries ${component})
    endif()
  endforeach()
  list(REMOVE_DUPLICATES libraries)
  set(${result} ${libraries} PARENT_SCOPE)
endfunction()
