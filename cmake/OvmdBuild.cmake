# What every target of the tree is compiled with.

add_library(ovmd_build_flags INTERFACE)
target_compile_options(ovmd_build_flags INTERFACE -Wall -Wextra -Wpedantic -Wconversion -Wshadow)
if(OVMD_WERROR)
  target_compile_options(ovmd_build_flags INTERFACE -Werror)
endif()
if(OVMD_SANITIZE)
  # The sanitizers' own runtime checks stop a test; a report that scrolls by is not a failure.
  target_compile_options(ovmd_build_flags INTERFACE -fsanitize=${OVMD_SANITIZE}
    -fno-sanitize-recover=all -fno-omit-frame-pointer)
  target_link_options(ovmd_build_flags INTERFACE -fsanitize=${OVMD_SANITIZE})
endif()
if(OVMD_BUILD_FUZZ)
  # The engine is told which paths a run took, of the library and of the host alike.
  target_compile_options(ovmd_build_flags INTERFACE -fsanitize=fuzzer-no-link)
endif()

# Adds a library of the reference host: ovmd_host_library(<target> <source>...).
function(ovmd_host_library target)
  add_library(${target} STATIC ${ARGN})
  set_target_properties(${target} PROPERTIES POSITION_INDEPENDENT_CODE ON)
  target_include_directories(${target} PUBLIC ${PROJECT_SOURCE_DIR} ${PROJECT_SOURCE_DIR}/include)
  target_link_libraries(${target} PRIVATE ovmd_build_flags)
endfunction()

# Adds the target whose headers every test program takes over, read once for all of them: they are
# most of a test's build. Sources still include what they use; CMAKE_DISABLE_PRECOMPILE_HEADERS=ON
# shows one that does not.
function(ovmd_test_headers target source)
  add_library(${target} OBJECT ${source})
  target_link_libraries(${target} PRIVATE ovmd_build_flags GTest::gmock)
  target_precompile_headers(${target} PRIVATE
    <gmock/gmock.h> <gtest/gtest.h> <algorithm> <filesystem> <map> <string> <vector>)
endfunction()

# Adds a GoogleTest program whose tests CTest runs one by one:
# ovmd_test(<target> SOURCES <source>... LIBS <library>...).
function(ovmd_test target)
  cmake_parse_arguments(arg "" "" "SOURCES;LIBS" ${ARGN})
  add_executable(${target} ${arg_SOURCES})
  target_include_directories(${target} PRIVATE ${PROJECT_SOURCE_DIR} ${PROJECT_SOURCE_DIR}/include)
  target_link_libraries(${target} PRIVATE ovmd_build_flags ${arg_LIBS} GTest::gmock_main)
  target_precompile_headers(${target} REUSE_FROM ovtest_headers)
  gtest_discover_tests(${target} DISCOVERY_MODE PRE_TEST PROPERTIES TIMEOUT 300)
endfunction()
