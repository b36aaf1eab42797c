# The Debian packages, one for each component; scripts/package makes them.
set(CPACK_GENERATOR DEB)
set(CPACK_SET_DESTDIR ON)  # what is written while installing names the prefix alone
set(CPACK_STRIP_FILES ON)
set(CPACK_COMPONENTS_ALL libmorwick1 libmorwick-dev morwick grellon)
set(CPACK_PRE_BUILD_SCRIPTS ${CMAKE_CURRENT_LIST_DIR}/finish.cmake)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_MAINTAINER "The maintainers of Morwick <morwick@packages.invalid>")
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS
  ${PROJECT_BINARY_DIR} ${PROJECT_BINARY_DIR}/platform/${MORWICK_PLATFORM})

# What the binaries are linked to from elsewhere is added to `depends`.
macro(debian_package component section depends description)
  string(TOUPPER ${component} name)
  set(CPACK_DEBIAN_${name}_PACKAGE_NAME ${component})
  set(CPACK_DEBIAN_${name}_PACKAGE_SECTION ${section})
  set(CPACK_DEBIAN_${name}_PACKAGE_DEPENDS "${depends}")
  set(CPACK_DEBIAN_${name}_DESCRIPTION "${description}")
endmacro()

set(library "libmorwick1 (= ${PROJECT_VERSION})")
debian_package(libmorwick1 libs ""
"Storage-controller access and statistics - library
Finds NAND storage controllers, connects to them, and turns the raw statistics
that they return into named values and readable text. The controllers of this
build are simulated.")
debian_package(libmorwick-dev libdevel "${library}"
"Storage-controller access and statistics - development files
Headers, manual page, and what pkg-config and CMake need to build tools with
libmorwick.")
debian_package(morwick utils "${library}"
"Storage-controller access and statistics - command
Finds NAND storage controllers and prints their statistics and snapshots, for
people and for scripts, and writes them for Prometheus by a timer that is off
until it is enabled. The controllers of this build are simulated.")
set(CPACK_DEBIAN_MORWICK_PACKAGE_SUGGESTS prometheus-node-exporter)
debian_package(grellon admin "${library}"
"Background BDR work of NAND storage controllers - daemon
Lets a NAND storage controller carry out its pending BDR work in slices, on AC
power, by a timer that is off until it is enabled. The controllers of this
build are simulated.")
set(CPACK_DEBIAN_LIBMORWICK1_PACKAGE_CONTROL_EXTRA ${CMAKE_CURRENT_LIST_DIR}/libmorwick1/triggers)

# The scripts of a package that has a service, which may leave files.
function(debian_service component service files)
  set(folder ${CMAKE_CURRENT_BINARY_DIR}/debian/${component})
  foreach(script postinst prerm postrm)
    configure_file(${CMAKE_CURRENT_LIST_DIR}/service/${script}.in ${folder}/${script} @ONLY)
    list(APPEND scripts ${folder}/${script})
  endforeach()
  string(TOUPPER ${component} name)
  set(CPACK_DEBIAN_${name}_PACKAGE_CONTROL_EXTRA ${scripts} PARENT_SCOPE)
endfunction()
debian_service(morwick morwick-metrics
  "/var/lib/prometheus/node-exporter/morwick.prom /var/lib/prometheus/node-exporter/morwick.prom.tmp-??????")
debian_service(grellon grellon "")
list(APPEND CPACK_DEBIAN_GRELLON_PACKAGE_CONTROL_EXTRA ${CMAKE_CURRENT_LIST_DIR}/grellon/conffiles)

include(CPack)
