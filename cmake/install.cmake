# cmake --install: the library with its soname, the reference host and its headers, the public
# headers, twa, a pkg-config file and a CMake package (find_package(twanlys)).
include(CMakePackageConfigHelpers)
set(TW_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/twanlys)

install(TARGETS twanlys twrt EXPORT twanlysTargets
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
        INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY include/twanlys DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(FILES host/twrt.h host/twrt.hpp DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
if(TW_APPS)
  install(TARGETS twa RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
endif()

install(EXPORT twanlysTargets NAMESPACE twanlys:: DESTINATION ${TW_CMAKE_DIR})
configure_package_config_file(cmake/twanlysConfig.cmake.in ${CMAKE_BINARY_DIR}/twanlysConfig.cmake
                              INSTALL_DESTINATION ${TW_CMAKE_DIR})
write_basic_package_version_file(${CMAKE_BINARY_DIR}/twanlysConfigVersion.cmake
                                  COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_BINARY_DIR}/twanlysConfig.cmake ${CMAKE_BINARY_DIR}/twanlysConfigVersion.cmake
        DESTINATION ${TW_CMAKE_DIR})

configure_file(cmake/twanlys.pc.in ${CMAKE_BINARY_DIR}/twanlys.pc @ONLY)
install(FILES ${CMAKE_BINARY_DIR}/twanlys.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

# The installed twa finds the library beside it.
if(TW_APPS)
  set_target_properties(twa PROPERTIES INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
endif()

# The Python package, with the prefix it was installed with, so that it finds the library there.
option(TW_PYTHON "Install the Python package under <prefix>/lib/python3/dist-packages" ON)
if(TW_PYTHON)
  set(TW_PYTHON_DIR ${CMAKE_INSTALL_LIBDIR}/python3/dist-packages)
  install(DIRECTORY python/twanlys DESTINATION ${TW_PYTHON_DIR} PATTERN __pycache__ EXCLUDE)
  install(CODE "file(WRITE \"\$ENV{DESTDIR}\${CMAKE_INSTALL_PREFIX}/${TW_PYTHON_DIR}/twanlys/_installed.py\"
    \"PREFIX = '\${CMAKE_INSTALL_PREFIX}'\\n\")")
endif()
