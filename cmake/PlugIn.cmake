# The plug-in: its components are OBJECT libraries, which together are appsync_client, a static library, and
# appsync_module, which a daemon loads.

foreach(component IN LISTS APPSYNC_PLUGIN_COMPONENTS)
  appsync_component(${component} OBJECT LINK platform)
  list(APPEND plugin_objects $<TARGET_OBJECTS:${component}>)
endforeach()

add_library(appsync_client STATIC ${plugin_objects})
target_link_libraries(appsync_client PUBLIC platform)
add_library(appsync::client ALIAS appsync_client)

# The loadable module: one entry point, and nothing else for a daemon to see. It is beside the programs as it will be where
# they are installed, so that they find it in both places by one path.
file(RELATIVE_PATH APPSYNC_MODULE_FOLDER_FROM_PROGRAM "${CMAKE_INSTALL_FULL_BINDIR}" "${CMAKE_INSTALL_FULL_LIBDIR}/appsync")
set(APPSYNC_MODULE_FROM_PROGRAM "${APPSYNC_MODULE_FOLDER_FROM_PROGRAM}/AppsClient.so")
set(exports "${CMAKE_SOURCE_DIR}/cmake/AppsClient.map")
add_library(appsync_module MODULE ${plugin_objects})
target_link_libraries(appsync_module PRIVATE $<BUILD_INTERFACE:appsync_options> platform)
# nodelete: its code stays until the process ends, as platform/Module.h promises.
target_link_options(appsync_module PRIVATE "LINKER:--version-script=${exports},-z,nodelete")
set_target_properties(
  appsync_module
  PROPERTIES OUTPUT_NAME AppsClient PREFIX "" SUFFIX .so LINK_DEPENDS "${exports}"
             LIBRARY_OUTPUT_DIRECTORY "${CMAKE_RUNTIME_OUTPUT_DIRECTORY}/${APPSYNC_MODULE_FOLDER_FROM_PROGRAM}")

# The public headers, and what they include of the plug-in.
set(public_headers
    core/AppsClient.h core/AppInstallUsingCoordination.h
    common/DemotionStatus.h common/Identifiers.h common/PlugInLog.h)
appsync_install_library(appsync_client client appsync)
foreach(header IN LISTS public_headers)
  cmake_path(GET header PARENT_PATH component)
  install(FILES "${CMAKE_SOURCE_DIR}/${header}" DESTINATION "${APPSYNC_INSTALL_INCLUDEDIR}/${component}")
endforeach()
set_target_properties(appsync_module PROPERTIES EXPORT_NAME module)
install(TARGETS appsync_module EXPORT appsync LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}/appsync")
add_dependencies(installable appsync_module)
