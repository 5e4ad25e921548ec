# The plug-in: five rooms that may include each other, base and platform, and nothing else. Each is an OBJECT library;
# together they are appsync_client, a static library, and appsync_module, which a daemon loads.

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

# The loadable module: one entry point, and nothing else for a daemon to see. It is beside the programs as it will be where
# they are installed, so that they find it in both places by one path.
file(RELATIVE_PATH APPSYNC_MODULE_FOLDER_FROM_PROGRAM "${CMAKE_INSTALL_FULL_BINDIR}" "${CMAKE_INSTALL_FULL_LIBDIR}/appsync")
set(APPSYNC_MODULE_FROM_PROGRAM "${APPSYNC_MODULE_FOLDER_FROM_PROGRAM}/AppsClient.so")
set(exports "${CMAKE_SOURCE_DIR}/cmake/AppsClient.map")
add_library(appsync_module MODULE ${plugin_objects})
target_link_libraries(appsync_module PRIVATE $<BUILD_INTERFACE:appsync_options> base platform)
# nodelete: its code stays until the process ends, as platform/Module.h promises.
target_link_options(appsync_module PRIVATE "LINKER:--version-script=${exports},-z,nodelete")
set_target_properties(
  appsync_module
  PROPERTIES OUTPUT_NAME AppsClient PREFIX "" SUFFIX .so LINK_DEPENDS "${exports}"
             LIBRARY_OUTPUT_DIRECTORY "${CMAKE_RUNTIME_OUTPUT_DIRECTORY}/${APPSYNC_MODULE_FOLDER_FROM_PROGRAM}")

# The public headers, and what they are made of.
set(public_headers
    core/AppsClient.h core/SyncFiles.h
    core/IdentifierSet.h core/PlugInLog.h coordination/AppInstallUsingCoordination.h restore/DemotionStatus.h)
appsync_install_library(appsync_client client appsync)
foreach(header IN LISTS public_headers)
  cmake_path(GET header PARENT_PATH room)
  install(FILES "${CMAKE_SOURCE_DIR}/${header}" DESTINATION "${APPSYNC_INSTALL_INCLUDEDIR}/${room}")
endforeach()
set_target_properties(appsync_module PROPERTIES EXPORT_NAME module)
install(TARGETS appsync_module EXPORT appsync LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}/appsync")
add_dependencies(installable appsync_module)
