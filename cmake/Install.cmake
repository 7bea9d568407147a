# Installation. `cmake --install <build> --prefix P` gives
#   P/bin/brixcli, P/bin/brixsim and the simulator's host programs (brixsim-mgmt-cmd, ...)
#   P/lib/libcmdkit.so, P/lib/libbrixhost.so
#   P/lib/brixcli/plugins/libbrixcli-system.so
#   P/include/cmdkit/*.h
#   P/lib/cmake/brixcli/  (find_package(brixcli CONFIG): brixcli::cmdkit, brixcli_add_plugin)
# Programs find lib/ through their RUNPATH $ORIGIN/../lib, brixcli finds its plug-in folder at
# ../lib/brixcli/plugins, and the simulator finds its host programs in the bin folder beside the
# folder of libbrixhost.
include(CMakePackageConfigHelpers)

set(BRIXCLI_INSTALL_PLUGINDIR lib/brixcli/plugins)
set(BRIXCLI_INSTALL_CMAKEDIR lib/cmake/brixcli)

# The plug-in sits two levels below lib/.
set_target_properties(brixcli-system PROPERTIES INSTALL_RPATH "$ORIGIN/../..")
# Plug-ins built elsewhere compile the framework's headers with at least this standard.
target_compile_features(cmdkit INTERFACE cxx_std_17)

get_target_property(BRIX_HOST_PROGRAMS host_programs MANUALLY_ADDED_DEPENDENCIES)
install(TARGETS brixcli brixsim ${BRIX_HOST_PROGRAMS} RUNTIME DESTINATION bin)
install(TARGETS brixhost LIBRARY DESTINATION lib)
install(TARGETS brixcli-system LIBRARY DESTINATION ${BRIXCLI_INSTALL_PLUGINDIR})
install(TARGETS cmdkit EXPORT brixcliTargets LIBRARY DESTINATION lib INCLUDES DESTINATION include)
install(DIRECTORY ${PROJECT_SOURCE_DIR}/platform/cmdkit DESTINATION include
        FILES_MATCHING PATTERN "*.h")

install(EXPORT brixcliTargets NAMESPACE brixcli:: DESTINATION ${BRIXCLI_INSTALL_CMAKEDIR})
configure_package_config_file(${CMAKE_CURRENT_LIST_DIR}/brixcliConfig.cmake.in
                              ${CMAKE_BINARY_DIR}/cmake/brixcliConfig.cmake
                              INSTALL_DESTINATION ${BRIXCLI_INSTALL_CMAKEDIR}
                              PATH_VARS BRIXCLI_INSTALL_PLUGINDIR)
# find_package(brixcli 1.0 CONFIG) accepts this release and later ones of the same major version.
write_basic_package_version_file(${CMAKE_BINARY_DIR}/cmake/brixcliConfigVersion.cmake
                                 VERSION ${PROJECT_VERSION} COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_BINARY_DIR}/cmake/brixcliConfig.cmake
              ${CMAKE_BINARY_DIR}/cmake/brixcliConfigVersion.cmake
        DESTINATION ${BRIXCLI_INSTALL_CMAKEDIR})
