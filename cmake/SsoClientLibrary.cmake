include("${CMAKE_CURRENT_LIST_DIR}/SsoClientInstall.cmake")
include("${CMAKE_CURRENT_LIST_DIR}/SsoClientTarget.cmake")

# ssoclient_add_library(NAME PACKAGE ... SOURCES ... INCLUDES ... HEADERS ... VERSION_SCRIPT ... DESCRIPTION ...
#                       [GENERATED ...] [VERSION_HEADER ...] [DEFINITIONS ...]
#                       [PUBLIC_LIBRARIES ...] [PRIVATE_LIBRARIES ...] [REQUIRES ...] [DEPENDENCIES ...])
# adds libNAME.so, which is installed as PACKAGE and linked as PACKAGE::NAME, from every source below the folder SOURCES:
#   NAME          the shared library, which exports what VERSION_SCRIPT lists
#   NAME_objects  its object files
#   NAME_static   the same object files with the include folders of SOURCES, for tests of what the shared library hides
# with each "-" of NAME replaced by "_" in the latter two. INCLUDES is the folder of the public headers, HEADERS the
# folder below it that is installed, GENERATED a folder of generated private headers, and VERSION_HEADER the name of a
# public header that is made from a template of this name, with ".in" appended, in INCLUDES. The libraries are those to
# link; REQUIRES and DEPENDENCIES are passed to ssoclient_install_package. SEPARATE_FOR_TESTS compiles each source on
# its own in a build with tests, which replace functions of one source that other sources call.
function(ssoclient_add_library name)
  cmake_parse_arguments(PARSE_ARGV 1 LIBRARY "SEPARATE_FOR_TESTS"
    "PACKAGE;SOURCES;INCLUDES;HEADERS;VERSION_SCRIPT;DESCRIPTION;GENERATED;VERSION_HEADER"
    "DEFINITIONS;PUBLIC_LIBRARIES;PRIVATE_LIBRARIES;REQUIRES;DEPENDENCIES")
  string(REPLACE "-" "_" prefix "${name}")
  file(GLOB_RECURSE sources CONFIGURE_DEPENDS "${LIBRARY_SOURCES}/*.cpp")

  add_library(${prefix}_objects OBJECT ${sources})
  target_compile_definitions(${prefix}_objects PRIVATE ${LIBRARY_DEFINITIONS})
  add_library(${name} SHARED $<TARGET_OBJECTS:${prefix}_objects>)
  add_library(${LIBRARY_PACKAGE}::${name} ALIAS ${name})
  add_library(${prefix}_static STATIC EXCLUDE_FROM_ALL $<TARGET_OBJECTS:${prefix}_objects>)
  target_include_directories(${prefix}_static INTERFACE "${LIBRARY_SOURCES}" ${LIBRARY_GENERATED})

  set(include_folders "${LIBRARY_INCLUDES}")
  if(LIBRARY_VERSION_HEADER)
    set(generated_includes "${CMAKE_CURRENT_BINARY_DIR}/include")
    configure_file("${LIBRARY_INCLUDES}/${LIBRARY_VERSION_HEADER}.in" "${generated_includes}/${LIBRARY_VERSION_HEADER}" @ONLY)
    list(APPEND include_folders "${generated_includes}")
    cmake_path(GET LIBRARY_HEADERS FILENAME folder)
    list(APPEND LIBRARY_HEADERS "${generated_includes}/${folder}")
  endif()
  foreach(target ${prefix}_objects ${name} ${prefix}_static)
    target_include_directories(${target}
      PUBLIC "$<BUILD_INTERFACE:${include_folders}>" $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}>
      PRIVATE "${LIBRARY_SOURCES}" ${LIBRARY_GENERATED})
    target_compile_features(${target} PUBLIC cxx_std_17)
    target_link_libraries(${target} PUBLIC ${LIBRARY_PUBLIC_LIBRARIES} PRIVATE ${LIBRARY_PRIVATE_LIBRARIES})
    ssoclient_configure_target(${target})
  endforeach()
  # Hidden headers include those of the private libraries.
  target_link_libraries(${prefix}_static PUBLIC ${LIBRARY_PRIVATE_LIBRARIES})
  if(NOT LIBRARY_SEPARATE_FOR_TESTS OR NOT SSOCLIENT_BUILD_TESTS)
    ssoclient_merge_folders(${prefix}_objects "${LIBRARY_SOURCES}" "${CMAKE_UNITY_BUILD}")
  endif()
  ssoclient_link_shared_library(${name} "${LIBRARY_VERSION_SCRIPT}")
  ssoclient_bind_calls(${name} ${prefix}_objects)
  # The loader finds the other libraries in the folder of this one, also for a program that is not linked to them.
  if(LIBRARY_REQUIRES)
    set_target_properties(${name} PROPERTIES INSTALL_RPATH "$ORIGIN")
  endif()

  ssoclient_install_package(NAME ${LIBRARY_PACKAGE} TARGET ${name} HEADERS ${LIBRARY_HEADERS}
    DESCRIPTION "${LIBRARY_DESCRIPTION}" REQUIRES ${LIBRARY_REQUIRES} DEPENDENCIES ${LIBRARY_DEPENDENCIES})
endfunction()

# ssoclient_merge_folders(OBJECTS FOLDER MERGES): if MERGES, compiles the sources of each folder below FOLDER as one
# translation unit, since most of the time goes into the headers that they share.
function(ssoclient_merge_folders objects folder merges)
  set_target_properties(${objects} PROPERTIES UNITY_BUILD "${merges}" UNITY_BUILD_MODE GROUP
    UNITY_BUILD_CODE_BEFORE_INCLUDE "// NOLINTNEXTLINE(bugprone-suspicious-include)")
  get_target_property(sources ${objects} SOURCES)
  foreach(source IN LISTS sources)
    cmake_path(GET source PARENT_PATH group)
    cmake_path(RELATIVE_PATH group BASE_DIRECTORY "${folder}")
    string(MAKE_C_IDENTIFIER "folder_${group}" group)
    set_source_files_properties("${source}" PROPERTIES UNITY_GROUP "${group}")
  endforeach()
endfunction()

# ssoclient_link_shared_library(TARGET VERSION_SCRIPT): sets the options and the version that the library is linked with.
function(ssoclient_link_shared_library target version_script)
  target_link_options(${target} PRIVATE "-Wl,--version-script=${version_script}")
  # A sanitizer's functions are resolved by the program.
  if(NOT SSOCLIENT_SANITIZER AND NOT SSOCLIENT_BUILD_FUZZERS)
    target_link_options(${target} PRIVATE -Wl,--no-undefined)
  endif()
  # The pool's threads may run or destroy a library's code after the last call into it has returned, so it is never
  # unloaded.
  target_link_options(${target} PRIVATE -Wl,-z,nodelete)
  set_target_properties(${target} PROPERTIES
    VERSION ${PROJECT_VERSION} SOVERSION ${PROJECT_VERSION_MAJOR} LINK_DEPENDS "${version_script}")
endfunction()

# ssoclient_bind_calls(TARGET OBJECTS): makes the calls of a shared library to its own functions direct, so that no
# other library can replace them, and resolves its calls to other libraries when it is loaded. OBJECTS is the target
# that compiles its sources. This saves 2 % of the time to check a token.
function(ssoclient_bind_calls target objects)
  target_compile_options(${objects} PRIVATE -fno-plt
    $<$<CXX_COMPILER_ID:GNU>:-fno-semantic-interposition>)
  target_link_options(${target} PRIVATE -Wl,-Bsymbolic-functions -Wl,-z,relro -Wl,-z,now)
endfunction()
