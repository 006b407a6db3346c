# What every target of the project is compiled with.

# A packager's compiler may know warnings that ours does not, so only the presets make them fatal.
option(FILEINDEX_WERROR "Treat warnings as errors" OFF)
option(FILEINDEX_COVERAGE "Instrument for gcov" OFF)
option(FILEINDEX_FUZZ "Build the fuzz targets; needs Clang" OFF)
set(FILEINDEX_SANITIZE "" CACHE STRING "Sanitizers to build with: \"address,undefined\" or \"thread\"")

if(NOT CMAKE_BUILD_TYPE AND NOT CMAKE_CONFIGURATION_TYPES)
    set(CMAKE_BUILD_TYPE RelWithDebInfo CACHE STRING "Kind of build" FORCE)
endif()

set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_C_STANDARD 99)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)

set(CMAKE_LIBRARY_OUTPUT_DIRECTORY "${PROJECT_BINARY_DIR}/lib")
set(CMAKE_ARCHIVE_OUTPUT_DIRECTORY "${PROJECT_BINARY_DIR}/lib")
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY "${PROJECT_BINARY_DIR}/bin")

# Libraries find each other beside themselves and programs find them in ../lib, so an install into any prefix
# runs as it is. The system's own directories need no search path.
if(NOT CMAKE_INSTALL_PREFIX STREQUAL "/usr" AND NOT DEFINED CMAKE_INSTALL_RPATH)
    file(RELATIVE_PATH binToLib "${CMAKE_INSTALL_FULL_BINDIR}" "${CMAKE_INSTALL_FULL_LIBDIR}")
    set(CMAKE_INSTALL_RPATH "$ORIGIN" "$ORIGIN/${binToLib}")
endif()

# Not -Wpedantic: it objects to the "%m" of syslog formats. The public headers are checked with it by a test.
add_library(project_warnings INTERFACE)
target_compile_options(project_warnings INTERFACE
    -Wall -Wextra -Wshadow
    $<$<COMPILE_LANGUAGE:CXX>:-Wnon-virtual-dtor>
    $<$<COMPILE_LANGUAGE:CXX>:-Woverloaded-virtual>
    $<$<BOOL:${FILEINDEX_WERROR}>:-Werror>)

if(FILEINDEX_SANITIZE)
    add_compile_options(-fsanitize=${FILEINDEX_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
    add_link_options(-fsanitize=${FILEINDEX_SANITIZE})
endif()

if(FILEINDEX_COVERAGE)
    add_compile_options(--coverage)
    add_link_options(--coverage)
endif()

# Every platform and C function is reached through an undefined symbol of its documented name, so that a program
# can put its own definition in front. Fortified headers would turn syslog into __syslog_chk and open into
# __open_2, large-file redirection open into open64; link-time optimisation might bind calls early.
function(plain_c_calls target)
    target_compile_options(${target} PRIVATE -U_FORTIFY_SOURCE -fno-lto)
    if(CMAKE_SIZEOF_VOID_P EQUAL 8)
        target_compile_options(${target} PRIVATE -U_FILE_OFFSET_BITS -U_TIME_BITS)
    endif()
endfunction()
