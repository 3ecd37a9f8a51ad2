# Installs the manual pages and the docs. If the simulator is built, also installs the manual page
# and the bash completion of apktoolkit-sim.
install(FILES man/apktoolkit.1 man/apktoolkit-verify.1 DESTINATION ${CMAKE_INSTALL_MANDIR}/man1)
install(FILES README.md CHANGES.md CONTRIBUTING.md SECURITY.md DESTINATION ${CMAKE_INSTALL_DOCDIR})
install(DIRECTORY docs DESTINATION ${CMAKE_INSTALL_DOCDIR})
if(APKTOOLKIT_SIMULATOR)
  install(FILES man/apktoolkit-sim.1 DESTINATION ${CMAKE_INSTALL_MANDIR}/man1)
  install(FILES simulator/apktoolkit-sim.bash RENAME apktoolkit-sim
    DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions)
endif()
