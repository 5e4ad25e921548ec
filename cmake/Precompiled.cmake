# The standard headers that nearly every source includes, compiled once for all components. Off in the ordinary build, where a
# source must name what it uses; on where that was proven already and compiling it all again is most of the time.

# How every component is compiled, because the plug-in is also a loadable module, and so that all can share one header: position
# independent, and with nothing for other modules to see or replace, which also lets calls be inlined.
set(appsync_module_code POSITION_INDEPENDENT_CODE ON CXX_VISIBILITY_PRESET hidden VISIBILITY_INLINES_HIDDEN ON)

option(APPSYNC_PRECOMPILED_COMPONENTS "Precompile the standard headers for the components" OFF)

if(APPSYNC_PRECOMPILED_COMPONENTS)
  file(CONFIGURE OUTPUT "${CMAKE_BINARY_DIR}/precompiled/Precompiled.cpp" CONTENT "// Only its precompiled header counts.\n")
  add_library(precompiled OBJECT "${CMAKE_BINARY_DIR}/precompiled/Precompiled.cpp")
  target_link_libraries(precompiled PRIVATE appsync_options)
  set_target_properties(precompiled PROPERTIES ${appsync_module_code})
  target_precompile_headers(precompiled PRIVATE
    <algorithm> <array> <cstdint> <functional> <map> <memory> <optional> <set> <span> <string> <string_view>
    <utility> <variant> <vector>)
endif()

# TARGET is the library of a component.
function(appsync_precompiled target)
  set_target_properties(${target} PROPERTIES ${appsync_module_code})
  if(APPSYNC_PRECOMPILED_COMPONENTS)
    target_precompile_headers(${target} REUSE_FROM precompiled)
  endif()
endfunction()
