# Language level, build type, where results go, compiler cache.

set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/bin")

# -O2 with symbols: fast enough to ship, and a crash on a device still has line numbers.
if(NOT CMAKE_BUILD_TYPE)
  set(CMAKE_BUILD_TYPE RelWithDebInfo CACHE STRING "Build type" FORCE)
endif()
set(CMAKE_CXX_FLAGS_RELWITHDEBINFO "-O2 -g1" CACHE STRING "Assertions stay on; line numbers only keep objects small" FORCE)
# -O1 keeps sanitized tests quick and their stacks readable.
set(CMAKE_CXX_FLAGS_SANITIZE "-O1 -g1" CACHE STRING "Sanitizers" FORCE)

# ccache shares objects between checkouts and presets: paths below the repository are made relative to the build folder, and
# the build folder's own name is kept out of debug information. It refuses precompiled headers unless told that they may be
# trusted; their own content is still hashed.
find_program(APPSYNC_CCACHE ccache)
if(APPSYNC_CCACHE AND (NOT CMAKE_CXX_COMPILER_LAUNCHER OR CMAKE_CXX_COMPILER_LAUNCHER STREQUAL "ccache"))
  set(CMAKE_CXX_COMPILER_LAUNCHER
      "${CMAKE_COMMAND}" -E env "CCACHE_BASEDIR=${CMAKE_SOURCE_DIR}" CCACHE_NOHASHDIR=1 CCACHE_SLOPPINESS=pch_defines,time_macros
      "${APPSYNC_CCACHE}")
  add_compile_options("-ffile-prefix-map=${CMAKE_SOURCE_DIR}/=" "-fdebug-prefix-map=${CMAKE_BINARY_DIR}=.")
endif()

find_package(Threads REQUIRED)
