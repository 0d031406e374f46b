# Apart from the daemon, because the tests of the library enter private roots too.
ovmd_host_library(ovhost_private_root ${CMAKE_CURRENT_LIST_DIR}/private_root.cpp)
