# The Windows build's dependencies: static libraries in the prefix that
# scripts/build_win64.sh cross-builds from Debian's source packages, named by
# HF_WIN64_DEPS. Everything is linked statically, so the executables need no
# DLL beyond Windows' own.
set(HF_WIN64_DEPS "" CACHE PATH "Prefix of the cross-built Windows dependencies")
if(NOT EXISTS "${HF_WIN64_DEPS}/bin/wx-config")
  message(FATAL_ERROR "HF_WIN64_DEPS must name the prefix scripts/build_win64.sh builds")
endif()
list(APPEND CMAKE_FIND_ROOT_PATH ${HF_WIN64_DEPS})
add_link_options(-static $<$<CONFIG:Release>:-s>)

set(wxWidgets_CONFIG_EXECUTABLE ${HF_WIN64_DEPS}/bin/wx-config)
find_package(wxWidgets 3.2 REQUIRED COMPONENTS base xml)
find_package(SQLite3 REQUIRED)
find_package(EXPAT REQUIRED)
set_property(TARGET EXPAT::EXPAT APPEND PROPERTY INTERFACE_COMPILE_DEFINITIONS XML_STATIC)

# JSON is header-only, installed into the prefix from its source package.
add_library(nlohmann_json::nlohmann_json INTERFACE IMPORTED)
target_include_directories(nlohmann_json::nlohmann_json SYSTEM INTERFACE ${HF_WIN64_DEPS}/include)

# GoogleTest from Debian's source package, built with the same compiler.
set(INSTALL_GTEST OFF CACHE BOOL "" FORCE)
set(gtest_force_shared_crt OFF CACHE BOOL "" FORCE)
add_subdirectory(/usr/src/googletest ${CMAKE_BINARY_DIR}/googletest EXCLUDE_FROM_ALL)
