# Installs the build into a folder of its own, and looks for what belongs to the programs.
#
#   cmake -DBUILD_DIR=... -DWORK_DIR=... -P install_test.cmake

file(REMOVE_RECURSE ${WORK_DIR})
execute_process(COMMAND ${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${WORK_DIR}
  RESULT_VARIABLE status OUTPUT_VARIABLE output ERROR_VARIABLE output)
if(NOT status EQUAL 0)
  message(FATAL_ERROR "the installation failed:\n${output}")
endif()
foreach(path sbin/mgmtd bin/jsond bin/ovctl
    share/man/man8/mgmtd.8 share/man/man8/jsond.8 share/man/man1/ovctl.1
    share/bash-completion/completions/ovctl share/zsh/site-functions/_ovctl
    lib/systemd/system/mgmtd.service lib/systemd/system/jsond.service
    lib/sysusers.d/mgmtd.conf lib/tmpfiles.d/mgmtd.conf)
  if(NOT EXISTS ${WORK_DIR}/${path})
    message(FATAL_ERROR "not installed: ${path}")
  endif()
endforeach()
foreach(unit mgmtd jsond)
  file(STRINGS ${WORK_DIR}/lib/systemd/system/${unit}.service places REGEX "@")
  list(FILTER places EXCLUDE REGEX "^SystemCallFilter=")
  if(places)
    message(FATAL_ERROR "${unit}.service has places that nothing was put into: ${places}")
  endif()
endforeach()
file(REMOVE_RECURSE ${WORK_DIR})
