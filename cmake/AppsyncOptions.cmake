# Warnings and sanitizers for all of our code, on the INTERFACE target appsync_options.

option(APPSYNC_WERROR "Treat warnings as errors" OFF)
set(APPSYNC_SANITIZE "" CACHE STRING "Sanitizers to build with: address,undefined or thread or fuzzer,address,undefined")
option(APPSYNC_COVERAGE "Count executed lines (gcov)" OFF)

add_library(appsync_options INTERFACE)
target_link_libraries(appsync_options INTERFACE Threads::Threads)

set(warnings
    -Wall -Wextra # the usual mistakes
    -Wpedantic # other compilers must accept this code too: the plug-in is ported
    -Wconversion -Wsign-conversion # lengths and offsets come from outside bytes; a silent narrowing there is a hole
    -Wshadow # a shadowed name in a lambda queued for later is read wrongly
    -Wold-style-cast # C casts hide which conversion is meant
    -Wnon-virtual-dtor -Woverloaded-virtual # services are interfaces: deleted through the base, overridden exactly
    -Wcast-align # records are read out of byte buffers
    -Wformat=2 # no format string that is not a literal
    -Wundef # a misspelt feature macro would count as 0
    -Wunused # dead code is removed, not kept
    -Wimplicit-fallthrough # every fall-through is said
    -Wextra-semi # keeps the formatter and -Wpedantic of both compilers in agreement
    -Wvla) # stack use never depends on input

if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  list(APPEND warnings
       -Wduplicated-cond -Wduplicated-branches -Wlogical-op # copied conditions and branches
       -Wsuggest-override # an override that stops overriding must not compile
       -Wredundant-decls # one declaration, in one header
       -Wno-restrict) # g++ 12 sees overlaps inside std::string's own concatenation that are not there
  # Left out: -Wnull-dereference warns inside the standard library's strings and vectors once they are inlined;
  # -Wuseless-cast calls casts between std::size_t and std::uint64_t useless, which other machines need.
else()
  list(APPEND warnings
       -Wno-unknown-warning-option
       -Wsuggest-override
       -Wthread-safety # the annotations that locks may carry
       -Wunreachable-code-aggressive # dead branches
       -Wnull-dereference # quiet here, unlike g++'s
       -Wno-gnu-zero-variadic-macro-arguments) # GoogleTest's parameterised suites rely on them
endif()

if(APPSYNC_WERROR)
  list(APPEND warnings -Werror)
endif()
target_compile_options(appsync_options INTERFACE ${warnings})

if(APPSYNC_SANITIZE)
  set(compile_flags -fsanitize=${APPSYNC_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
  set(link_flags -fsanitize=${APPSYNC_SANITIZE})
  if(APPSYNC_SANITIZE MATCHES "fuzzer")
    # Everything is instrumented; only a fuzz target links libFuzzer's main (see fuzz/CMakeLists.txt).
    string(REPLACE "fuzzer" "fuzzer-no-link" compile_flags "${compile_flags}")
    string(REPLACE "fuzzer" "fuzzer-no-link" link_flags "${link_flags}")
  endif()
  target_compile_options(appsync_options INTERFACE ${compile_flags})
  target_link_options(appsync_options INTERFACE ${link_flags})
  set(APPSYNC_INSTRUMENTATION ${link_flags}) # what a program must be linked with beside our libraries
endif()

if(APPSYNC_COVERAGE)
  # Atomic counters: the tests run many threads. Absolute paths: headers are found through symbolic links.
  target_compile_options(appsync_options INTERFACE --coverage -fprofile-update=atomic -fprofile-abs-path)
  target_link_options(appsync_options INTERFACE --coverage)
  set(APPSYNC_INSTRUMENTATION --coverage)
endif()
