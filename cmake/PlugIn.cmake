# The plug-in: five rooms that may include each other, base and platform, and nothing else. Each is an OBJECT library;
# together they are appsync_client.

set(APPSYNC_PLUGIN_ROOMS core transfer coordination restore reporting)

add_library(plugin_headers INTERFACE)
foreach(room IN LISTS APPSYNC_PLUGIN_ROOMS)
  appsync_headers(${room})
  target_link_libraries(plugin_headers INTERFACE ${room}_headers)
endforeach()

foreach(room IN LISTS APPSYNC_PLUGIN_ROOMS)
  add_subdirectory(${room})
  get_target_property(type ${room} TYPE)
  if(type STREQUAL "OBJECT_LIBRARY")
    list(APPEND plugin_objects $<TARGET_OBJECTS:${room}>)
  endif()
endforeach()

if(plugin_objects)
  add_library(appsync_client STATIC ${plugin_objects})
  target_link_libraries(appsync_client PUBLIC plugin_headers base platform)
else()
  add_library(appsync_client INTERFACE)
  target_link_libraries(appsync_client INTERFACE plugin_headers base platform)
endif()
add_library(appsync::client ALIAS appsync_client)
