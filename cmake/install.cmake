# What `cmake --install` (and `make install`) puts under the prefix: the
# library with its SONAME and version links, the public header, a pkg-config
# file and a CMake package (find_package(qoraio32)), and the two user tools.
# Every installed file finds the others relative to itself, so the tree
# works wherever it is put (--prefix, DESTDIR).
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set(QORA_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/qoraio32)

install(TARGETS qoraio32 EXPORT qoraio32Targets LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(FILES api/qoraio32.h DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(EXPORT qoraio32Targets NAMESPACE qoraio32:: DESTINATION ${QORA_CMAKE_DIR})

configure_package_config_file(cmake/qoraio32Config.cmake.in
  ${CMAKE_CURRENT_BINARY_DIR}/qoraio32Config.cmake INSTALL_DESTINATION ${QORA_CMAKE_DIR})
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/qoraio32ConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/qoraio32Config.cmake
  ${CMAKE_CURRENT_BINARY_DIR}/qoraio32ConfigVersion.cmake DESTINATION ${QORA_CMAKE_DIR})

# The .pc file names its prefix from its own place.
file(RELATIVE_PATH QORA_PC_TO_PREFIX /prefix/${CMAKE_INSTALL_LIBDIR}/pkgconfig /prefix)
configure_file(cmake/qoraio32.pc.in ${CMAKE_CURRENT_BINARY_DIR}/qoraio32.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/qoraio32.pc
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

file(RELATIVE_PATH QORA_BIN_TO_LIB /prefix/${CMAKE_INSTALL_BINDIR} /prefix/${CMAKE_INSTALL_LIBDIR})
set_target_properties(qoradump qoraconv PROPERTIES INSTALL_RPATH "$ORIGIN/${QORA_BIN_TO_LIB}")
install(TARGETS qoradump qoraconv RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
