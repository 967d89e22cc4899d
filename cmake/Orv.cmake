# The options that every target of the project is built with, and functions that add targets.

add_library(orv_options INTERFACE)
# 32-bit builds support files and inode numbers as large as 64-bit builds do.
target_compile_definitions(orv_options INTERFACE _FILE_OFFSET_BITS=64)
target_compile_options(orv_options INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wundef -Wformat=2 -Wimplicit-fallthrough
  $<$<COMPILE_LANGUAGE:CXX>:-Wnon-virtual-dtor -Woverloaded-virtual>
  # GCC 12 sees overlapping copies where there are none, in the concatenation of strings.
  $<$<COMPILE_LANG_AND_ID:CXX,GNU>:-Wno-restrict>
  # Of several files that are compiled as one, each has names of its own.
  $<$<AND:$<BOOL:$<TARGET_PROPERTY:UNITY_BUILD>>,$<COMPILE_LANG_AND_ID:CXX,GNU>>:-Wno-shadow;-Wno-subobject-linkage>
  $<$<BOOL:${ORV_WERROR}>:-Werror>
  # Source names in log records are relative to the project, wherever it is built.
  "-fmacro-prefix-map=${CMAKE_SOURCE_DIR}/=")
target_link_options(orv_options INTERFACE
  -Wl,-z,relro,-z,now,-z,noexecstack -Wl,--as-needed -Wl,--no-undefined)
if(ORV_SANITIZE)
  target_compile_options(orv_options INTERFACE -fsanitize=${ORV_SANITIZE} -fno-omit-frame-pointer -fno-sanitize-recover=all)
  target_link_options(orv_options INTERFACE -fsanitize=${ORV_SANITIZE})
endif()

# orv_small(TARGET sources...): optimises sources of the target for size. For code that runs only once in a process, or
# for a command, so that it takes less memory afterwards.
function(orv_small target)
  set_source_files_properties(${ARGN} TARGET_DIRECTORY ${target}
    PROPERTIES COMPILE_OPTIONS "$<$<NOT:$<CONFIG:Debug>>:-Os>")
endfunction()

# orv_shared_library(TARGET [NOT_INSTALLED] sources...): adds a library lib<TARGET>.so.1 that exports only the symbols
# that the version script <TARGET>.map of its folder names.
function(orv_shared_library target)
  cmake_parse_arguments(PARSE_ARGV 1 arg "NOT_INSTALLED" "" "")
  add_library(${target} SHARED ${arg_UNPARSED_ARGUMENTS})
  set(map "${CMAKE_CURRENT_SOURCE_DIR}/${target}.map")
  set_target_properties(${target} PROPERTIES
    VERSION ${PROJECT_VERSION} SOVERSION 1
    CXX_VISIBILITY_PRESET default VISIBILITY_INLINES_HIDDEN ON
    LINK_DEPENDS "${map}")
  target_link_options(${target} PRIVATE "-Wl,--version-script=${map}")
  target_link_libraries(${target} PRIVATE orv_options)
  if(NOT arg_NOT_INSTALLED)
    install(TARGETS ${target} LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}" NAMELINK_SKIP)
  endif()
endfunction()

# orv_provider_library(TARGET sources...): adds a shared library, and a link to it in the folder where object managers
# look for providers, under the name that they derive from its registration.
function(orv_provider_library target)
  orv_shared_library(${target} ${ARGN})
  set(link "${CMAKE_CURRENT_BINARY_DIR}/lib${target}.so")
  file(CREATE_LINK "../lib${target}.so.1" "${link}" SYMBOLIC)
  install(FILES "${link}" DESTINATION "${CMAKE_INSTALL_LIBDIR}/cmpi")
endfunction()

# orv_install_manual(FILE): installs a manual page of docs/man, compressed with gzip.
function(orv_install_manual file)
  string(REGEX REPLACE ".*\\." "" section "${file}")
  set(source "${PROJECT_SOURCE_DIR}/docs/man/${file}")
  set(compressed "${CMAKE_CURRENT_BINARY_DIR}/${file}.gz")
  add_custom_command(OUTPUT "${compressed}"
    COMMAND gzip -9 --no-name --to-stdout "${source}" > "${compressed}"
    DEPENDS "${source}" VERBATIM)
  add_custom_target(manual-${file} ALL DEPENDS "${compressed}")
  install(FILES "${compressed}" DESTINATION "${CMAKE_INSTALL_MANDIR}/man${section}")
endfunction()

# Further options for test programs. They are compiled often and run briefly, so the compiler's time counts and theirs
# does not. The sanitizers' checks for null and misaligned references, and for objects of another class, apply to the
# tested code only: in the tests' own code, they would nearly double the time of compilation.
string(FIND "${ORV_SANITIZE}" undefined position)
add_library(orv_test_options INTERFACE)
target_compile_options(orv_test_options INTERFACE -O0 -g1 -U_FORTIFY_SOURCE
  $<$<NOT:$<EQUAL:${position},-1>>:-fno-sanitize=null,alignment,vptr>)

# orv_add_test(NAME [THREADS] SOURCES... [SEQUENTIAL...] LIBRARIES... [EXCEPT PATTERN]): adds a GoogleTest program that
# ctest runs. EXCEPT leaves out the tests whose names match PATTERN; another test has to run them. With THREADS, the
# program is one of those that run under ThreadSanitizer: the target threaded_tests builds them, the label threads
# selects them. SEQUENTIAL are sources with tests that use one thread only, which builds with ThreadSanitizer leave out.
function(orv_add_test name)
  cmake_parse_arguments(PARSE_ARGV 1 arg "THREADS" "EXCEPT" "SOURCES;SEQUENTIAL;LIBRARIES")
  if(NOT ORV_SANITIZE STREQUAL "thread")
    list(APPEND arg_SOURCES ${arg_SEQUENTIAL})
  endif()
  add_executable(${name} ${arg_SOURCES})
  target_link_libraries(${name} PRIVATE
    orv_options orv_test_options ${arg_LIBRARIES} GTest::gmock GTest::gtest_main)
  # The precompiled headers are C++, and CMake would use them for every language of the program.
  if(TARGET orv_test_headers AND NOT "${arg_SOURCES}" MATCHES "\\.c(;|$)")
    target_precompile_headers(${name} REUSE_FROM orv_test_headers)
  endif()
  set(filter)
  if(arg_EXCEPT)
    set(filter "--gtest_filter=-${arg_EXCEPT}")
  endif()
  add_test(NAME ${name} COMMAND ${name} ${filter})
  set_tests_properties(${name} PROPERTIES TIMEOUT 600)
  if(arg_THREADS)
    set_property(TEST ${name} APPEND PROPERTY LABELS threads)
    add_dependencies(threaded_tests ${name})
  endif()
endfunction()

# orv_test_schema(TARGET FOLDER): fills FOLDER with the shipped schema and registrations and those of the tests' own
# provider, for a program that loads this provider.
function(orv_test_schema target folder)
  add_custom_target(${target}_schema
    COMMAND "${CMAKE_COMMAND}" -E copy_directory
      "${CMAKE_BINARY_DIR}/share/orv/schema" "${CMAKE_SOURCE_DIR}/tests/objectmanager/cimxml/schema" "${folder}"
    VERBATIM)
  add_dependencies(${target}_schema orv_schema)
  add_dependencies(${target} ${target}_schema)
endfunction()
