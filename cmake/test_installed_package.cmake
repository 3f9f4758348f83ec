# Installs the build into a fresh prefix, builds one example as a project of its own against the
# installed package, and runs it against a port where nothing listens: it must fail with the text
# of the library's catalogue, which proves the catalogue was installed where the library looks.
#   cmake -DBUILD_DIR=... -DEXAMPLE_DIR=... -DGENERATOR=... -DSANITIZE=ON|OFF -P test_installed_package.cmake
string(RANDOM LENGTH 8 suffix)
set(root /tmp/zel-install-${suffix})
set(prefix ${root}/prefix)

function(run)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE code OUTPUT_VARIABLE out ERROR_VARIABLE err)
  if(NOT code EQUAL 0)
    file(REMOVE_RECURSE ${root})
    message(FATAL_ERROR "failed (${code}): ${ARGN}\n${out}\n${err}")
  endif()
endfunction()

run(${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${prefix})
foreach(file include/zelserverapi/zelserverapi.h lib/pkgconfig/zelserverapi.pc
             lib/cmake/zelserverapi/zelserverapiConfig.cmake)
  if(NOT EXISTS ${prefix}/${file})
    file(GLOB_RECURSE found RELATIVE ${prefix} ${prefix}/*)
    file(REMOVE_RECURSE ${root})
    message(FATAL_ERROR "not installed: ${file}; installed: ${found}")
  endif()
endforeach()

# An instrumented library needs its runtime in the program too.
set(flags "")
if(SANITIZE)
  set(flags "-fsanitize=address,undefined")
endif()
run(${CMAKE_COMMAND} -S ${EXAMPLE_DIR} -B ${root}/build -G ${GENERATOR}
    -DCMAKE_PREFIX_PATH=${prefix} "-DCMAKE_CXX_FLAGS=${flags}" "-DCMAKE_EXE_LINKER_FLAGS=${flags}")
run(${CMAKE_COMMAND} --build ${root}/build)

get_filename_component(name ${EXAMPLE_DIR} NAME)
# Port 1 on loopback: nothing listens there without root.
execute_process(COMMAND ${root}/build/zel_example_${name} 127.0.0.1 1 nobody nothing
  RESULT_VARIABLE code OUTPUT_VARIABLE out ERROR_VARIABLE err)
file(REMOVE_RECURSE ${root})
if(NOT code EQUAL 1 OR NOT err MATCHES "error 393601: Could not connect to the server")
  message(FATAL_ERROR "unexpected outcome (${code}):\n${out}\n${err}")
endif()
message(STATUS "installed package builds and runs: ${err}")
