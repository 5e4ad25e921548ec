# A room is a folder of the repository with one target of its name. Its headers are reached as "room/Header.h" through an
# include root that holds this one room alone, so a target sees exactly the rooms it links: a wrong include does not
# compile. (The repository's root is on nobody's include path.)

# The include root of ROOM, as INTERFACE target ROOM_headers.
function(appsync_headers room)
  set(root "${CMAKE_BINARY_DIR}/rooms/${room}")
  file(MAKE_DIRECTORY "${root}")
  file(CREATE_LINK "${CMAKE_SOURCE_DIR}/${room}" "${root}/${room}" SYMBOLIC)
  add_library(${room}_headers INTERFACE)
  target_include_directories(${room}_headers INTERFACE "${root}")
  # Debuggers, sanitizers and coverage name the file in the repository, not the way it was found.
  target_compile_options(${room}_headers INTERFACE "-ffile-prefix-map=${root}/${room}=${CMAKE_SOURCE_DIR}/${room}")
endfunction()

# Library ROOM of KIND (STATIC or OBJECT) from the *.cpp in the room's folder and below. A room without sources is an
# INTERFACE library of the same name. LINK names what its headers and sources may include.
function(appsync_room room kind)
  cmake_parse_arguments(PARSE_ARGV 2 arg "" "" "LINK")
  file(GLOB_RECURSE sources CONFIGURE_DEPENDS "${CMAKE_SOURCE_DIR}/${room}/*.cpp")
  if(sources)
    add_library(${room} ${kind} ${sources})
    appsync_precompiled(${room})
    appsync_tidy(${room})
    target_link_libraries(${room} PRIVATE $<BUILD_INTERFACE:appsync_options> PUBLIC $<BUILD_INTERFACE:${room}_headers> ${arg_LINK})
  else()
    add_library(${room} INTERFACE)
    target_link_libraries(${room} INTERFACE $<BUILD_INTERFACE:${room}_headers> ${arg_LINK})
  endif()
endfunction()

# The targets of the rooms whose headers SOURCE includes, for programs of one file.
function(appsync_used_rooms source result)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS "${source}")
  file(STRINGS "${source}" includes REGEX "^#include \"[a-z]+/")
  foreach(include IN LISTS includes)
    string(REGEX REPLACE "^#include \"([a-z]+)/.*" "\\1" room "${include}")
    if(room STREQUAL "tests")
      list(APPEND rooms tests_headers_all)
    elseif(room IN_LIST APPSYNC_PLUGIN_ROOMS)
      list(APPEND rooms appsync_client)
    elseif(room MATCHES "^(base|platform|device|tools|kit)$")
      list(APPEND rooms ${room})
    endif()
  endforeach()
  list(REMOVE_DUPLICATES rooms)
  set(${result} ${rooms} PARENT_SCOPE)
endfunction()
