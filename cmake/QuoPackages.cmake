# SPDX-License-Identifier: Apache-2.0

# Debian packages, one for each installed component: cpack -G DEB --config BUILD_FOLDER/CPackConfig.cmake
set(CPACK_PACKAGE_NAME quo_base)
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_PACKAGE_CONTACT "quo_base maintainers <maintainers@users.noreply.c-seed-73808124.example>")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "${PROJECT_DESCRIPTION}")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
set(CPACK_PRE_BUILD_SCRIPTS "${PROJECT_SOURCE_DIR}/cmake/QuoPackageFiles.cmake")
set(CPACK_COMPONENTS_ALL runtime development tools)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS_POLICY ">=")
set(CPACK_DEBIAN_ENABLE_COMPONENT_DEPENDS OFF)

set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME libquo-base1)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION libs)
set(CPACK_COMPONENT_RUNTIME_DESCRIPTION "synthetic aperture radar base library: shared library
 Descriptions of radar products kept in XML headers, raster files, orbits and
 geolocation, polynomials, least squares, Fourier transforms and resampling.")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_CONTROL_EXTRA "${PROJECT_SOURCE_DIR}/cmake/debian/triggers")

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libquo-base-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "libquo-base1 (= ${PROJECT_VERSION})")
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SHLIBDEPS OFF)
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION "synthetic aperture radar base library: development files
 Headers, CMake package and pkg-config file for programs that use the library.")

set(CPACK_DEBIAN_TOOLS_PACKAGE_NAME quo-tools)
set(CPACK_DEBIAN_TOOLS_PACKAGE_SECTION science)
set(CPACK_DEBIAN_TOOLS_PACKAGE_DEPENDS "libquo-base1 (= ${PROJECT_VERSION})")
set(CPACK_COMPONENT_TOOLS_DESCRIPTION "radar geometry and products at the command line
 The tool quo geolocates image samples, checks and changes product headers,
 converts and shows rasters, and fits and derives polynomials.")

if(QUO_PYTHON)
    list(APPEND CPACK_COMPONENTS_ALL python)
    set(CPACK_DEBIAN_PYTHON_PACKAGE_NAME python3-quo-base)
    set(CPACK_DEBIAN_PYTHON_PACKAGE_SECTION python)
    set(CPACK_DEBIAN_PYTHON_PACKAGE_DEPENDS "libquo-base1 (= ${PROJECT_VERSION}), ${QUO_PYTHON_DEPENDS}")
    set(CPACK_DEBIAN_PYTHON_PACKAGE_SUGGESTS
        "python3-xarray, python3-dask, python3-distributed, python3-rasterio, python3-pyproj, python3-matplotlib")
    set(CPACK_DEBIAN_PYTHON_PACKAGE_CONTROL_EXTRA
        "${PROJECT_SOURCE_DIR}/cmake/debian/python/postinst;${PROJECT_SOURCE_DIR}/cmake/debian/python/prerm")
    set(CPACK_COMPONENT_PYTHON_DESCRIPTION "radar geometry and products in Python
 Products, orbits, rasters, polynomials and transforms with numpy arrays, maps
 of images, and data sets for xarray and dask.")
endif()
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS "${PROJECT_BINARY_DIR}/libsrc")

# Packing what was built, without looking first whether tests and benchmarks are up to date.
set(CMAKE_SKIP_INSTALL_ALL_DEPENDENCY ON)


include(CPack)
