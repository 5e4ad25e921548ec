# Target tidy: clang-tidy over every source that ships, each again only when its object file was. It needs a clang++
# build, whose flags clang-tidy understands; elsewhere appsync_tidy does nothing. Tests are left to both compilers'
# warnings: they are most of the code, and what clang-tidy finds in them does not pay for its time.

find_program(APPSYNC_CLANG_TIDY clang-tidy)
if(APPSYNC_CLANG_TIDY AND CMAKE_CXX_COMPILER_ID STREQUAL "Clang")
  add_custom_target(tidy)
endif()

# Has target tidy check the sources of TARGET. To be called in the folder that made TARGET.
function(appsync_tidy target)
  if(NOT TARGET tidy)
    return()
  endif()
  get_target_property(sources ${target} SOURCES)
  foreach(source IN LISTS sources)
    cmake_path(ABSOLUTE_PATH source BASE_DIRECTORY "${CMAKE_CURRENT_SOURCE_DIR}")
    cmake_path(IS_PREFIX CMAKE_CURRENT_SOURCE_DIR "${source}" NORMALIZE inside)
    if(NOT inside)
      continue()
    endif()
    cmake_path(RELATIVE_PATH source BASE_DIRECTORY "${CMAKE_CURRENT_SOURCE_DIR}" OUTPUT_VARIABLE relative)
    set(stamp "${CMAKE_CURRENT_BINARY_DIR}/tidy/${relative}.stamp")
    cmake_path(GET stamp PARENT_PATH stamp_folder)
    file(MAKE_DIRECTORY "${stamp_folder}")
    add_custom_command(
      OUTPUT "${stamp}"
      COMMAND "${APPSYNC_CLANG_TIDY}" --quiet -p "${CMAKE_BINARY_DIR}" "${source}"
      COMMAND "${CMAKE_COMMAND}" -E touch "${stamp}"
      # The object file is newer than every header it was made of.
      DEPENDS "${source}" "${CMAKE_CURRENT_BINARY_DIR}/CMakeFiles/${target}.dir/${relative}.o" "${CMAKE_SOURCE_DIR}/.clang-tidy"
      COMMENT "clang-tidy ${relative}"
      VERBATIM)
    list(APPEND stamps "${stamp}")
  endforeach()
  add_custom_target(${target}_tidy DEPENDS ${stamps})
  add_dependencies(tidy ${target}_tidy)
endfunction()
