# What `cmake --install` lays out below a prefix: the tool, the loadable module, static libraries with their headers, and
# the packages by which CMake and pkg-config find them. Everything is found relative to the prefix, which may be moved.
# Integrators see one include root, where every header keeps its component: #include "platform/Platform.h".

include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set(APPSYNC_INSTALL_INCLUDEDIR "${CMAKE_INSTALL_INCLUDEDIR}/appsync")
set(APPSYNC_INSTALL_PACKAGEDIR "${CMAKE_INSTALL_LIBDIR}/cmake/appsync")
set(APPSYNC_INSTALL_PKGCONFIGDIR "${CMAKE_INSTALL_LIBDIR}/pkgconfig")

# All that is built to be installed.
add_custom_target(installable)

# Installs library TARGET, which integrators link as appsync::NAME. PART is "appsync", or "appsync-NAME" for what only those
# get who ask for COMPONENTS NAME.
function(appsync_install_library target name part)
  get_target_property(type ${target} TYPE)
  if(NOT type STREQUAL "INTERFACE_LIBRARY")
    set_target_properties(${target} PROPERTIES OUTPUT_NAME appsync_${name})
  endif()
  set_target_properties(${target} PROPERTIES EXPORT_NAME ${name})
  target_compile_features(${target} INTERFACE cxx_std_20)
  target_include_directories(${target} INTERFACE "$<INSTALL_INTERFACE:${APPSYNC_INSTALL_INCLUDEDIR}>")
  install(TARGETS ${target} EXPORT ${part} ARCHIVE DESTINATION "${CMAKE_INSTALL_LIBDIR}")
  set_property(GLOBAL APPEND PROPERTY APPSYNC_INSTALLED_PARTS ${part})
  add_dependencies(installable ${target})
endfunction()

# Installs the headers of a component, those of its internal directory left out.
function(appsync_install_headers component)
  install(DIRECTORY "${CMAKE_SOURCE_DIR}/${component}" DESTINATION "${APPSYNC_INSTALL_INCLUDEDIR}"
          FILES_MATCHING PATTERN "*.h" PATTERN internal EXCLUDE)
endfunction()

# Installs NAME.pc, made of cmake/NAME.pc.in.
function(appsync_install_pkgconfig name)
  file(RELATIVE_PATH prefix "/${APPSYNC_INSTALL_PKGCONFIGDIR}" /)
  configure_file("${CMAKE_SOURCE_DIR}/cmake/${name}.pc.in" "${CMAKE_BINARY_DIR}/${name}.pc" @ONLY)
  install(FILES "${CMAKE_BINARY_DIR}/${name}.pc" DESTINATION "${APPSYNC_INSTALL_PKGCONFIGDIR}")
endfunction()

# Installs man pages and completions, which the tool's users find without looking for them.
function(appsync_install_help)
  file(GLOB pages CONFIGURE_DEPENDS "${CMAKE_SOURCE_DIR}/docs/man/*.1")
  install(FILES ${pages} DESTINATION "${CMAKE_INSTALL_MANDIR}/man1")
  set(completions "${CMAKE_SOURCE_DIR}/cli/completions")
  install(FILES "${completions}/appsync.bash" RENAME appsync DESTINATION "${CMAKE_INSTALL_DATADIR}/bash-completion/completions")
  install(FILES "${completions}/_appsync" DESTINATION "${CMAKE_INSTALL_DATADIR}/zsh/site-functions")
  install(FILES "${completions}/appsync.fish" DESTINATION "${CMAKE_INSTALL_DATADIR}/fish/vendor_completions.d")
endfunction()

# Installs the CMake package of all parts. To be called last.
function(appsync_install_package)
  get_property(parts GLOBAL PROPERTY APPSYNC_INSTALLED_PARTS)
  list(REMOVE_DUPLICATES parts)
  foreach(part IN LISTS parts)
    install(EXPORT ${part} NAMESPACE appsync:: FILE ${part}-targets.cmake DESTINATION "${APPSYNC_INSTALL_PACKAGEDIR}")
  endforeach()
  configure_package_config_file("${CMAKE_SOURCE_DIR}/cmake/appsync-config.cmake.in" "${CMAKE_BINARY_DIR}/appsync-config.cmake"
                                INSTALL_DESTINATION "${APPSYNC_INSTALL_PACKAGEDIR}")
  write_basic_package_version_file("${CMAKE_BINARY_DIR}/appsync-config-version.cmake" COMPATIBILITY SameMinorVersion)
  install(FILES "${CMAKE_BINARY_DIR}/appsync-config.cmake" "${CMAKE_BINARY_DIR}/appsync-config-version.cmake"
          DESTINATION "${APPSYNC_INSTALL_PACKAGEDIR}")
endfunction()
