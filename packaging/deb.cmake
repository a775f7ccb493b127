# Run by cpack between installing the components into its staging folder and packing them: adds what Debian
# wants in each package beside the project's own files.

# stage_documents(<component> <package>): usr/share/doc/<package>.
function(stage_documents component package)
  set(folder ${CPACK_TEMPORARY_INSTALL_DIRECTORY}/${component}/usr/share/doc/${package})
  file(MAKE_DIRECTORY ${folder})
  configure_file(${CPACK_GRIDMILL_DEBIAN_DIR}/copyright ${folder}/copyright COPYONLY)
  # -n: no name and no time in the compressed file, so that the same package comes out the same.
  execute_process(COMMAND gzip -9nc ${CPACK_GRIDMILL_DEBIAN_DIR}/changelog
                  OUTPUT_FILE ${folder}/changelog.Debian.gz COMMAND_ERROR_IS_FATAL ANY)
  file(CHMOD ${folder}/copyright ${folder}/changelog.Debian.gz
       PERMISSIONS OWNER_READ OWNER_WRITE GROUP_READ WORLD_READ)
  file(CHMOD ${folder} ${CPACK_TEMPORARY_INSTALL_DIRECTORY}/${component}/usr/share/doc
             ${CPACK_TEMPORARY_INSTALL_DIRECTORY}/${component}/usr/share
       PERMISSIONS ${CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS})
endfunction()

# A library beside the folder that the loader searches would install without a word and not be found.
execute_process(COMMAND dpkg-architecture -qDEB_HOST_MULTIARCH OUTPUT_VARIABLE multiarch
                OUTPUT_STRIP_TRAILING_WHITESPACE COMMAND_ERROR_IS_FATAL ANY)
file(GLOB library ${CPACK_TEMPORARY_INSTALL_DIRECTORY}/runtime/usr/lib/${multiarch}/libgridmill.so.*)
if(NOT library)
  message(FATAL_ERROR "The library is not in /usr/lib/${multiarch}: configure with -DCMAKE_INSTALL_PREFIX=/usr")
endif()

file(STRINGS ${CPACK_GRIDMILL_DEBIAN_DIR}/changelog newest LIMIT_COUNT 1)
set(expected "gridmill (${CPACK_PACKAGE_VERSION}-${CPACK_DEBIAN_PACKAGE_RELEASE})")
string(FIND "${newest}" "${expected}" place)
if(NOT place EQUAL 0)
  message(FATAL_ERROR "packaging/debian/changelog begins with '${newest}', not with '${expected}'")
endif()

foreach(component IN LISTS CPACK_COMPONENTS_ALL)
  string(TOUPPER ${component} upper)
  stage_documents(${component} ${CPACK_DEBIAN_${upper}_PACKAGE_NAME})
endforeach()
