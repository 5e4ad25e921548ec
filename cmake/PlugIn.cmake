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
  list(APPEND plugin_objects $<TARGET_OBJECTS:${room}>)
endforeach()

add_library(appsync_client STATIC ${plugin_objects})
target_link_libraries(appsync_client PUBLIC $<BUILD_INTERFACE:plugin_headers> base platform)
add_library(appsync::client ALIAS appsync_client)

# The public headers, and what they are made of.
set(public_headers
    core/AppsClient.h core/SyncFiles.h
    core/IdentifierSet.h core/PlugInLog.h coordination/AppInstallUsingCoordination.h restore/DemotionStatus.h)
appsync_install_library(appsync_client client appsync)
foreach(header IN LISTS public_headers)
  cmake_path(GET header PARENT_PATH room)
  install(FILES "${CMAKE_SOURCE_DIR}/${header}" DESTINATION "${APPSYNC_INSTALL_INCLUDEDIR}/${room}")
endforeach()
