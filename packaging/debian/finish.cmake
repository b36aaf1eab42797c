# Adds what every Debian package has to what was installed: copyright file, change log and overrides,
# manual pages compressed. Run by CPack before it packs.
string(TIMESTAMP date "%a, %d %b %Y %H:%M:%S +0000" UTC)
foreach(package IN LISTS CPACK_COMPONENTS_ALL)
  set(share ${CPACK_TEMPORARY_DIRECTORY}/${package}${CPACK_PACKAGING_INSTALL_PREFIX}/share)
  set(documents ${share}/doc/${package})
  file(COPY ${CMAKE_CURRENT_LIST_DIR}/copyright DESTINATION ${documents})
  file(WRITE ${documents}/changelog "${package} (${CPACK_PACKAGE_VERSION}) unstable; urgency=medium

  * See CHANGES.md of the package morwick.

 -- ${CPACK_DEBIAN_PACKAGE_MAINTAINER}  ${date}
")
  file(GLOB pages ${share}/man/*/*)
  execute_process(COMMAND gzip -9n ${documents}/changelog ${pages} COMMAND_ERROR_IS_FATAL ANY)
  set(overrides ${CMAKE_CURRENT_LIST_DIR}/${package}/overrides)
  if(EXISTS ${overrides})
    configure_file(${overrides} ${share}/lintian/overrides/${package} COPYONLY)
  endif()
endforeach()
