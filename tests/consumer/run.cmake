# Installs the built library into a scratch prefix, then builds against it, with the compiler's
# default language standard: the small program here (find_package(NavMiscLib), the umbrella
# header), the programs of examples/, and one example again through pkg-config. The installed
# navmisc builds a demo data root on which the examples then run.
file(REMOVE_RECURSE ${WORK_DIR})
set(prefix ${WORK_DIR}/prefix)

function(run what)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
  if(rc)
    message(FATAL_ERROR "${what} failed (${rc}):\n${out}${err}")
  endif()
  set(out "${out}" PARENT_SCOPE)
endfunction()

run("install" ${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${prefix})
foreach(project consumer examples)
  if(project STREQUAL "consumer")
    set(source ${SOURCE_DIR}/tests/consumer)
  else()
    set(source ${SOURCE_DIR}/examples)
  endif()
  run("configure of ${project}" ${CMAKE_COMMAND} -S ${source} -B ${WORK_DIR}/${project}
      -DCMAKE_PREFIX_PATH=${prefix} -DCMAKE_BUILD_TYPE=Release
      "-DCMAKE_CXX_FLAGS=${CONSUMER_FLAGS}" "-DCMAKE_EXE_LINKER_FLAGS=${CONSUMER_FLAGS}")
  run("build of ${project}" ${CMAKE_COMMAND} --build ${WORK_DIR}/${project})
endforeach()
run("the consumer" ${WORK_DIR}/consumer/consumer)

# The examples on a demo data root made by the installed program.
set(root ${WORK_DIR}/data)
run("navmisc demo" ${prefix}/bin/navmisc demo ${root})
if(NOT out MATCHES "Try: navmisc --data-root [^\n]* place ([0-9A-F_]+) --time ([-0-9T:Z]+)")
  message(FATAL_ERROR "no place example in the demo's output:\n${out}")
endif()
set(trip ${CMAKE_MATCH_1})
string(REGEX REPLACE "Z$" "" time ${CMAKE_MATCH_2})
run("open_and_export" ${WORK_DIR}/examples/open_and_export ${root} ${trip} ${WORK_DIR}/trip.gpx)
message(STATUS "${out}")
file(READ ${WORK_DIR}/trip.gpx gpx LIMIT 200)
if(NOT gpx MATCHES "^<\\?xml")
  message(FATAL_ERROR "open_and_export wrote no GPX document")
endif()
run("place_photo" ${WORK_DIR}/examples/place_photo ${root} ${trip} ${time})
message(STATUS "${out}")

# pkg-config: the include folder for every language, the C++ standard for C++ only.
find_program(PKG_CONFIG pkg-config REQUIRED)
set(pc ${PKG_CONFIG} --define-variable=prefix=${prefix})
set(ENV{PKG_CONFIG_PATH} ${prefix}/${LIBDIR}/pkgconfig)
run("pkg-config --cflags" ${pc} --cflags navmisc)
separate_arguments(cflags UNIX_COMMAND "${out}")
run("pkg-config --variable=cxxflags" ${pc} --variable=cxxflags navmisc)
separate_arguments(cxxflags UNIX_COMMAND "${out}")
run("pkg-config --libs" ${pc} --libs navmisc)
separate_arguments(libs UNIX_COMMAND "${out}")
separate_arguments(flags UNIX_COMMAND "${CONSUMER_FLAGS}")
file(WRITE ${WORK_DIR}/plain.c "int main(void) { return 0; }\n")
run("a C program with the package's Cflags" cc -Werror ${cflags} -c ${WORK_DIR}/plain.c -o ${WORK_DIR}/plain.o)
run("place_photo through pkg-config" c++ ${flags} ${cflags} ${cxxflags} ${SOURCE_DIR}/examples/place_photo.cpp
    ${libs} -Wl,-rpath,${prefix}/${LIBDIR} -o ${WORK_DIR}/place_photo_pc)
run("place_photo built through pkg-config" ${WORK_DIR}/place_photo_pc ${root} ${trip} ${time})
