# Builds the Debian package of the OWUtils build BUILD_DIR into WORK_DIR with cpack and checks
# that it holds the tool, the library, the headers, the CMake package and the pkg-config file.
#   cmake -DBUILD_DIR=... -DWORK_DIR=... -P RunPackageTest.cmake
file(REMOVE_RECURSE ${WORK_DIR})
execute_process(COMMAND ${CMAKE_CPACK_COMMAND} -G DEB -B ${WORK_DIR} --config ${BUILD_DIR}/CPackConfig.cmake
  RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
if(NOT rc EQUAL 0)
  message(FATAL_ERROR "cpack failed (${rc}):\n${out}\n${err}")
endif()
file(GLOB packages ${WORK_DIR}/owutils_*.deb)
list(LENGTH packages count)
if(NOT count EQUAL 1)
  message(FATAL_ERROR "expected one owutils_*.deb in ${WORK_DIR}, found: ${packages}")
endif()
execute_process(COMMAND dpkg-deb --contents ${packages} OUTPUT_VARIABLE contents RESULT_VARIABLE rc)
foreach(entry ./usr/bin/owutil ./usr/lib/libOWUtils.so.19 ./usr/include/owutils/tstring.h
    ./usr/lib/cmake/OWUtils/OWUtilsConfig.cmake ./usr/lib/pkgconfig/owutils.pc)
  string(FIND "${contents}" " ${entry}" at)
  if(at EQUAL -1)
    message(FATAL_ERROR "the package lacks ${entry}:\n${contents}")
  endif()
endforeach()
execute_process(COMMAND dpkg-deb --field ${packages} Package Version Depends OUTPUT_VARIABLE fields)
message(STATUS "${packages}\n${fields}")
file(REMOVE_RECURSE ${WORK_DIR})
