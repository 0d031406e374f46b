# Builds the library alone from its sources, installs it, and builds a project against what was
# installed: once with the CMake package, once with pkg-config. Then the same with folders given as
# absolute paths, as some distributions do.
#
#   cmake -DSOURCE_DIR=... -DC_COMPILER=... -DCXX_COMPILER=... -DGENERATOR=...
#     -DCONSUMER_DIR=... -P install_test.cmake

set(compilers -G ${GENERATOR} -DCMAKE_C_COMPILER=${C_COMPILER} -DCMAKE_CXX_COMPILER=${CXX_COMPILER})

function(run)
  execute_process(COMMAND ${ARGV} RESULT_VARIABLE status OUTPUT_VARIABLE output
    ERROR_VARIABLE output)
  if(NOT status EQUAL 0)
    list(JOIN ARGV " " command)
    message(FATAL_ERROR "${command}\nfailed:\n${output}")
  endif()
endfunction()

function(expect_file path)
  if(NOT EXISTS ${path})
    message(FATAL_ERROR "not installed: ${path}")
  endif()
endfunction()

function(expect_files libdir includedir)
  foreach(name libovmd.so libovmd.so.1 libovmd.so.1.0.0 pkgconfig/ovmd.pc
      cmake/ovmd/ovmd-config.cmake cmake/ovmd/ovmd-config-version.cmake)
    expect_file(${libdir}/${name})
  endforeach()
  foreach(folder framework include/orvale)
    file(GLOB headers RELATIVE ${SOURCE_DIR}/${folder} ${SOURCE_DIR}/${folder}/*.h)
    cmake_path(GET folder FILENAME installed)
    foreach(header ${headers})
      expect_file(${includedir}/ovmd/${installed}/${header})
    endforeach()
  endforeach()
endfunction()

# A project of somebody else's against what was installed.
function(expect_usable work_dir libdir)
  cmake_path(GET libdir PARENT_PATH prefix)
  run(${CMAKE_COMMAND} -S ${CONSUMER_DIR} -B ${work_dir}/consumer ${compilers}
    -DCMAKE_PREFIX_PATH=${prefix})
  run(${CMAKE_COMMAND} --build ${work_dir}/consumer)

  set(ENV{PKG_CONFIG_PATH} ${libdir}/pkgconfig)
  execute_process(COMMAND pkg-config --cflags --libs ovmd OUTPUT_VARIABLE flags
    OUTPUT_STRIP_TRAILING_WHITESPACE COMMAND_ERROR_IS_FATAL ANY)
  separate_arguments(flags UNIX_COMMAND "${flags}")
  set(strict -Wall -Wextra -Wpedantic -Werror -shared -fPIC)
  run(${C_COMPILER} -std=c11 ${strict} ${CONSUMER_DIR}/consumer.c ${flags}
    -o ${work_dir}/consumer-c.so)
  run(${CXX_COMPILER} -std=c++20 ${strict} ${CONSUMER_DIR}/consumer.cpp ${flags}
    -o ${work_dir}/consumer-cpp.so)
endfunction()

# Configures with the folders as they are given, installs and uses what is there.
function(check_install name given_libdir given_includedir)
  set(work_dir ${WORK_DIR}/${name})
  set(prefix ${work_dir}/prefix)
  run(${CMAKE_COMMAND} -S ${SOURCE_DIR} -B ${WORK_DIR}/build ${compilers}
    -DOVMD_BUILD_HOST=OFF -DOVMD_BUILD_TESTS=OFF -DCMAKE_INSTALL_PREFIX=${prefix}
    -DCMAKE_INSTALL_LIBDIR=${given_libdir} -DCMAKE_INSTALL_INCLUDEDIR=${given_includedir})
  run(${CMAKE_COMMAND} --build ${WORK_DIR}/build)
  run(${CMAKE_COMMAND} --install ${WORK_DIR}/build)
  cmake_path(ABSOLUTE_PATH given_libdir BASE_DIRECTORY ${prefix} OUTPUT_VARIABLE libdir)
  cmake_path(ABSOLUTE_PATH given_includedir BASE_DIRECTORY ${prefix} OUTPUT_VARIABLE includedir)
  expect_files(${libdir} ${includedir})
  expect_usable(${work_dir} ${libdir})
endfunction()

# Outside the source tree, which may hold the build tree: an absolute folder for headers must not lie
# in the sources.
execute_process(COMMAND mktemp -d OUTPUT_VARIABLE WORK_DIR OUTPUT_STRIP_TRAILING_WHITESPACE
  COMMAND_ERROR_IS_FATAL ANY)
check_install(relative lib include)
check_install(absolute ${WORK_DIR}/elsewhere/lib ${WORK_DIR}/elsewhere/headers)
file(REMOVE_RECURSE ${WORK_DIR})
