# What "cmake --install" puts where. The plug-in, kestcfg, its data, the host headers, the
# manual page and the shell completion form the default component. The simulated controller
# library has the real controller library's soname, so it lives in a private directory of the
# package as the optional component "simulator" (cmake --install ... --component simulator);
# the installed plug-in has no search path to it, and kestcfg loads it explicitly.
include(GNUInstallDirs)

install(TARGETS kestcfg RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
install(TARGETS vqkestSysApiChassisExpert LIBRARY DESTINATION ${KEST_PLUGIN_INSTALL_DIR})
install(FILES data/timezone.ini DESTINATION ${KEST_DATA_INSTALL_DIR})
install(DIRECTORY include/uxsys include/kest DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(FILES tools/kestcfg/kestcfg.bash-completion
        DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions RENAME kestcfg)
if(KESTCFG_MANUAL_PAGE)
  install(FILES ${KESTCFG_MANUAL_PAGE} DESTINATION ${CMAKE_INSTALL_MANDIR}/man1)
endif()
install(TARGETS vqtargetcfg LIBRARY DESTINATION ${KEST_SIMULATOR_INSTALL_DIR} NAMELINK_SKIP
        COMPONENT simulator EXCLUDE_FROM_ALL)
