# The Debian package: `cpack -G DEB` in a build tree (scripts/package does it all) writes
# lineprobe_<version>_<arch>.deb from the install rules. Its version is the project's.

set(LINEPROBE_MAINTAINER "lineprobe maintainers <lineprobe-maintainers@example.org>"
    CACHE STRING "Maintainer field of the Debian package: Name <address>")

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME lineprobe)
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_PACKAGE_CONTACT ${LINEPROBE_MAINTAINER})
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY
    "console diagnostics for the telephony interface boards of the VX7 platform")
# The package holds what `cmake --install` would put under the configured prefix, so the paths
# that the manual pages name are where the files are. scripts/package configures /usr.
set(CPACK_PACKAGING_INSTALL_PREFIX ${CMAKE_INSTALL_PREFIX})
set(CPACK_STRIP_FILES ON)

set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_RELEASE "")
set(CPACK_DEBIAN_PACKAGE_SECTION net)
set(CPACK_DEBIAN_PACKAGE_PRIORITY optional)
set(CPACK_DEBIAN_PACKAGE_MAINTAINER ${LINEPROBE_MAINTAINER})
# CPack puts the summary in front as the synopsis line; this is the long description.
set(CPACK_DEBIAN_PACKAGE_DESCRIPTION
    "lineprobe shows, on a text terminal of at least 40 rows and 100 columns, the
boards of the host and live rows for phones (one channel of a line) and
trunks (one digital line), and drives calls, service states, loopback and
the remote alarm indication from a command prompt.
.
vx7sim emulates the boards of a farm file and serves them over TCP as a
relay host, so that lineprobe runs without hardware.")
# Dependencies are read from the binaries by dpkg-shlibdeps; the help command runs the pager.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_DEPENDS "less")
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS OFF)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
# Directories the package creates get 0755 whatever the builder's umask.
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)

include(CPack)
