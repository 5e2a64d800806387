# Installs the OWUtils build BUILD_DIR into WORK_DIR/prefix, checks the layout, runs the
# installed owutil, then builds the client project SOURCE_DIR against the installed tree (CMake
# package and pkg-config file) and runs both client programs.
#   cmake -DBUILD_DIR=... -DSOURCE_DIR=... -DWORK_DIR=... -DLIBDIR=lib -DGENERATOR=Ninja
#         [-DCXX_COMPILER=...] [-DCLIENT_FLAGS=...] -P RunInstallTest.cmake
function(run)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
  if(NOT rc EQUAL 0)
    list(JOIN ARGN " " line)
    message(FATAL_ERROR "failed (${rc}): ${line}\n${out}\n${err}")
  endif()
  set(out "${out}" PARENT_SCOPE)
endfunction()

function(expect_match text regex what)
  if(NOT text MATCHES "${regex}")
    message(FATAL_ERROR "${what}: expected to match '${regex}', got:\n${text}")
  endif()
endfunction()

set(prefix ${WORK_DIR}/prefix)
file(REMOVE_RECURSE ${WORK_DIR})
run(${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${prefix})

foreach(file
    bin/owutil
    ${LIBDIR}/libOWUtils.so
    include/owutils/tstring.h
    include/owutils/Exceptions.h
    ${LIBDIR}/cmake/OWUtils/OWUtilsConfig.cmake
    ${LIBDIR}/cmake/OWUtils/OWUtilsConfigVersion.cmake
    ${LIBDIR}/cmake/OWUtils/OWUtilsTargets.cmake
    ${LIBDIR}/pkgconfig/owutils.pc)
  if(NOT EXISTS ${prefix}/${file})
    message(FATAL_ERROR "not installed: ${file}")
  endif()
endforeach()
# The resource modules lie beside the library, in English and German.
foreach(module AppRes EngineRes LFRes AppMsg)
  foreach(language 409 407)
    if(NOT EXISTS ${prefix}/${LIBDIR}/OW${module}${language}.so)
      message(FATAL_ERROR "resource module not installed beside the library: OW${module}${language}.so")
    endif()
  endforeach()
endforeach()

# The installed tool runs from the installed tree (its library found through its run path).
run(${prefix}/bin/owutil --help)
expect_match("${out}" "Usage: owutil" "owutil --help")
run(${prefix}/bin/owutil types)
expect_match("${out}" "\n13 +aes256 +256 +16 +256-bit AES\n" "owutil types")
run(${prefix}/bin/owutil digest --string abc)
expect_match("${out}" "^a9993e364706816aba3e25717850c26c9cd0d89d\n$" "owutil digest")
# The installed library finds the installed modules beside it (default drive map C=/).
run(${CMAKE_COMMAND} -E env --unset=OWUTILS_DRIVES ${prefix}/bin/owutil oem)
expect_match("${out}" "^version: [0-9]+\\.[0-9]+ build [0-9]+\n" "owutil oem")

set(configure ${CMAKE_COMMAND} -S ${SOURCE_DIR} -B ${WORK_DIR}/build -G ${GENERATOR}
  -DCMAKE_PREFIX_PATH=${prefix} -DCMAKE_BUILD_TYPE=Release)
if(CXX_COMPILER)
  list(APPEND configure -DCMAKE_CXX_COMPILER=${CXX_COMPILER})
endif()
if(CLIENT_FLAGS)
  list(APPEND configure "-DCMAKE_CXX_FLAGS=${CLIENT_FLAGS}" "-DCMAKE_EXE_LINKER_FLAGS=${CLIENT_FLAGS}")
endif()
run(${configure})
run(${CMAKE_COMMAND} --build ${WORK_DIR}/build)
foreach(client client client_pkgconfig)
  run(${WORK_DIR}/build/${client})
  expect_match("${out}" "^client 19\ncaught PreconditionFailed0\nsha1\\(abc\\) a9993e364706816aba3e25717850c26c9cd0d89d\n$"
    "${client}")
  message(STATUS "${client}: ${out}")
endforeach()
file(REMOVE_RECURSE ${WORK_DIR})
