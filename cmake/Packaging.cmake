# Debian packages through cpack: libgridmill0, libgridmill-dev and, with the Python package, python3-gridmill.
# packaging/build_packages is the way in; docs/install.md says more.
#
# No flags of Debian's are added, hardening among them: what is packed is the library that was tested and
# measured.
if(NOT PROJECT_IS_TOP_LEVEL)
  return()
endif()
set(packaging_dir ${PROJECT_SOURCE_DIR}/packaging)

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME gridmill)
# Debian wants an address. The domain `invalid` is reserved for those that do not exist.
set(CPACK_PACKAGE_CONTACT "The gridmill developers <developers@gridmill.invalid>")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "") # would stand before that of each package
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_PACKAGE_DIRECTORY ${PROJECT_BINARY_DIR}/packages)
set(CPACK_STRIP_FILES ON)
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
# After the files are in place and before they are packed: copyright, changelog, and a look at the folders.
set(CPACK_PRE_BUILD_SCRIPTS ${packaging_dir}/deb.cmake)
set(CPACK_GRIDMILL_DEBIAN_DIR ${packaging_dir}/debian)
set(CPACK_GRIDMILL_LICENSE ${PROJECT_SOURCE_DIR}/LICENSE)

set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_RELEASE 1)
set(CPACK_DEBIAN_PACKAGE_PRIORITY optional)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(gridmill_deb_version ${PROJECT_VERSION}-${CPACK_DEBIAN_PACKAGE_RELEASE})

# libgridmill0
set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME libgridmill${GRIDMILL_ABI})
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SHLIBDEPS ON)
# For the packages of others: a program that was linked with this version needs it or a later one of the same
# ABI. Not by CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS, which is for all components and stumbles over the
# extension module.
file(WRITE ${PROJECT_BINARY_DIR}/debian/shlibs
     "libgridmill ${GRIDMILL_ABI} libgridmill${GRIDMILL_ABI} (>= ${PROJECT_VERSION})\n")
# cpack adds scripts that call ldconfig too; Debian's tools know the trigger only.
set(CPACK_DEBIAN_RUNTIME_PACKAGE_CONTROL_EXTRA
    ${packaging_dir}/debian/runtime/triggers ${PROJECT_BINARY_DIR}/debian/shlibs)
set(CPACK_DEBIAN_RUNTIME_DESCRIPTION
    "raster image operators for remote sensing - shared library
Gridmill has operators for terrain, vegetation indices, change detection,
classes and stretches of raster images. It writes the same bits on every
instruction set and with any number of threads.
.
This package holds the shared library.")

# libgridmill-dev
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libgridmill-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "libgridmill${GRIDMILL_ABI} (= ${gridmill_deb_version})")
set(CPACK_DEBIAN_DEVELOPMENT_DESCRIPTION
    "raster image operators for remote sensing - development files
Gridmill has operators for terrain, vegetation indices, change detection,
classes and stretches of raster images. It writes the same bits on every
instruction set and with any number of threads.
.
This package holds the C++ headers and the files for CMake and pkg-config.")

# python3-gridmill
set(CPACK_DEBIAN_PYTHON_PACKAGE_NAME python3-gridmill)
set(CPACK_DEBIAN_PYTHON_PACKAGE_SECTION python)
set(CPACK_DEBIAN_PYTHON_PACKAGE_SHLIBDEPS ON)
# The extension module is built for the one Python that is there.
set(CPACK_DEBIAN_PYTHON_PACKAGE_DEPENDS
    "python3 (>= 3.11), python3 (<< 3.12), python3-numpy"
    "libgridmill${GRIDMILL_ABI} (= ${gridmill_deb_version})")
list(JOIN CPACK_DEBIAN_PYTHON_PACKAGE_DEPENDS ", " CPACK_DEBIAN_PYTHON_PACKAGE_DEPENDS)
set(CPACK_DEBIAN_PYTHON_PACKAGE_SUGGESTS "python3-xarray, python3-dask, python3-distributed")
set(CPACK_DEBIAN_PYTHON_PACKAGE_CONTROL_EXTRA
    ${packaging_dir}/debian/python/postinst ${packaging_dir}/debian/python/prerm)
set(CPACK_DEBIAN_PYTHON_DESCRIPTION
    "raster image operators for remote sensing - Python package
Gridmill has operators for terrain, vegetation indices, change detection,
classes and stretches of raster images. It writes the same bits on every
instruction set and with any number of threads.
.
This package holds the Python functions over NumPy arrays, which take dask
arrays and xarray's DataArrays too where these are installed.")

set(CPACK_COMPONENTS_ALL runtime development)
if(GRIDMILL_BUILD_PYTHON)
  list(APPEND CPACK_COMPONENTS_ALL python)
endif()
# dpkg-shlibdeps asks for the library of the extension module, which no installed package holds yet.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${PROJECT_BINARY_DIR})
include(CPack)
