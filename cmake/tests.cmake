# The tests: one program of C++ tests, of which each source file is one test
# of ctest; checks in Python that run the built programs.

# -------------------------------------------------------- GoogleTest --

if(NOT EXISTS ${ZX_GTEST_DIR}/googletest/CMakeLists.txt)
  message(FATAL_ERROR "No GoogleTest sources in ${ZX_GTEST_DIR}: install the "
          "package googletest, or set ZX_GTEST_DIR")
endif()
add_subdirectory(${ZX_GTEST_DIR}/googletest ${CMAKE_BINARY_DIR}/googletest
                 EXCLUDE_FROM_ALL SYSTEM)
target_compile_options(gtest PRIVATE -w)

# ---------------------------------------------------- the test program --

# What the tests share; the fault program below takes the part that it needs.
set(kit_main ${CMAKE_SOURCE_DIR}/tests/kit/kit_main.cpp)
file(GLOB kit_sources CONFIGURE_DEPENDS ${CMAKE_SOURCE_DIR}/tests/kit/*.cpp)
list(REMOVE_ITEM kit_sources ${kit_main})
list(FILTER kit_sources EXCLUDE REGEX "_${ZX_OTHER_TARGET}\\.cpp$")
add_library(zx_kit STATIC ${kit_sources})
target_include_directories(zx_kit PUBLIC ${CMAKE_SOURCE_DIR}/tests)
target_link_libraries(zx_kit PUBLIC hvl zxlib gtest PRIVATE zx_test_flags)

set(test_globs)
foreach(folder zxlib hvl obautil fuzz e2e)
  list(APPEND test_globs ${CMAKE_SOURCE_DIR}/tests/${folder}/*_test.cpp)
endforeach()
file(GLOB test_sources CONFIGURE_DEPENDS ${test_globs})

# The functions that fuzzing feeds; their tests feed them with the corpora.
file(GLOB fuzz_sources CONFIGURE_DEPENDS ${CMAKE_SOURCE_DIR}/fuzz/*.cpp)
list(REMOVE_ITEM fuzz_sources ${CMAKE_SOURCE_DIR}/fuzz/entry.cpp)

# vtx2csv comes whole, with the globals that every application defines; of the
# other tools only the modules, as an application has one set of globals.
add_executable(zx_tests ${kit_main} ${test_sources} ${fuzz_sources})
target_include_directories(zx_tests PRIVATE ${CMAKE_SOURCE_DIR})
target_link_libraries(zx_tests PRIVATE zx_test_flags vtx2csv_main)
zx_take_modules(zx_tests ${zx_tools})
target_link_libraries(zx_tests PRIVATE zx_kit hvl zxlib gtest)

# vtx2csv with an entry point that makes chosen system calls fail.
file(GLOB fault_main CONFIGURE_DEPENDS
     ${CMAKE_SOURCE_DIR}/tests/e2e/fault_main.cpp)
if(fault_main)
  add_executable(vtx2csv_faults ${fault_main})
  target_link_libraries(vtx2csv_faults PRIVATE zx_test_flags vtx2csv_main)
  zx_take_modules(vtx2csv_faults vtx2csv)
  target_link_libraries(vtx2csv_faults PRIVATE zx_kit hvl zxlib)
endif()

# ----------------------------------------------------- tests of ctest --

# The tests run in a folder of their own, so that a careless one does not
# write into the source tree.  Under Wine a path of this system stands on Z:.
set(zx_work_dir ${CMAKE_BINARY_DIR}/work)
file(MAKE_DIRECTORY ${zx_work_dir})
set(zx_host_environment
    "ASAN_OPTIONS=detect_leaks=1:allocator_may_return_null=1"
    "UBSAN_OPTIONS=print_stacktrace=1"
    "PYTHONDONTWRITEBYTECODE=1")
set(zx_drive)
if(WIN32)
  set(zx_drive "Z:")
endif()

# Runs the C++ tests that match `filter`.  A filter that matches none fails.
function(zx_add_test name filter)
  add_test(NAME ${name} COMMAND zx_tests --gtest_filter=${filter}
           WORKING_DIRECTORY ${zx_work_dir})
  set_tests_properties(${name} PROPERTIES
    ENVIRONMENT "${zx_host_environment};\
ZX_BIN_DIR=${zx_drive}${CMAKE_BINARY_DIR}/bin;\
ZX_SOURCE_DIR=${zx_drive}${CMAKE_SOURCE_DIR}"
    FAIL_REGULAR_EXPRESSION "Running 0 tests from 0 test suites")
endfunction()

# The file x_test.cpp holds the suites "x" (plain, or with parameters or types)
# and, for what takes long, "x_slow".
set(all_filters)
foreach(source IN LISTS test_sources)
  cmake_path(GET source STEM stem)
  cmake_path(GET source PARENT_PATH folder)
  cmake_path(GET folder FILENAME folder)
  string(REGEX REPLACE "_test$" "" stem ${stem})
  set(filter "${stem}.*:${stem}/*.*:*/${stem}.*")
  zx_add_test(${folder}/${stem} ${filter})
  list(APPEND all_filters ${filter})

  # Whether a file has slow tests can change with each edit.
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${source})
  file(STRINGS ${source} slow_tests REGEX "^TEST(_F)?\\(${stem}_slow *,")
  if(slow_tests)
    zx_add_test(${folder}/${stem}.slow "${stem}_slow.*")
    set_tests_properties(${folder}/${stem}.slow PROPERTIES LABELS slow
                         TIMEOUT 1800)
    list(APPEND all_filters "${stem}_slow.*")
  endif()
endforeach()

# A suite under any other name would run nowhere: running all but the known
# suites must find nothing to do.
if(all_filters)
  list(JOIN all_filters ":" all_filters)
  zx_add_test(kit/every_suite_is_run "-${all_filters}")
  set_tests_properties(kit/every_suite_is_run PROPERTIES
    FAIL_REGULAR_EXPRESSION ""
    PASS_REGULAR_EXPRESSION "Running 0 tests from 0 test suites")
endif()

# --------------------------------------------------- checks in Python --

# The distribution's own Python first: one that a user has put ahead of it in
# PATH may be anything.
find_program(ZX_PYTHON3 python3 PATHS /usr/bin NO_DEFAULT_PATH)
find_program(ZX_PYTHON3 python3)
set(zx_launcher ${CMAKE_CROSSCOMPILING_EMULATOR})
list(JOIN zx_launcher " " zx_launcher)

# Runs `source` with the program that it checks.  Without Python the check is
# there, too, and says why it was skipped.
function(zx_add_check name source program)
  if(ZX_PYTHON3)
    string(STRIP "${zx_launcher} $<TARGET_FILE:${program}>" command)
    add_test(NAME ${name} WORKING_DIRECTORY ${zx_work_dir}
             COMMAND ${ZX_PYTHON3} ${source} --tool ${command}
                     --bin-dir ${CMAKE_BINARY_DIR}/bin ${ARGN})
  else()
    add_test(NAME ${name}
             COMMAND sh -c "echo 'skipped: there is no python3'; exit 77")
  endif()
  set_tests_properties(${name} PROPERTIES SKIP_RETURN_CODE 77
    ENVIRONMENT "${zx_host_environment};\
ZX_BIN_DIR=${CMAKE_BINARY_DIR}/bin;ZX_SOURCE_DIR=${CMAKE_SOURCE_DIR}")
endfunction()

# Those of the programs drive the tool; those of a module drive the test
# program, which carries out a case for them.
set(zx_check_program_e2e vtx2csv)
set(zx_check_program_zxlib zx_tests)
foreach(folder e2e zxlib)
  file(GLOB checks CONFIGURE_DEPENDS
       ${CMAKE_SOURCE_DIR}/tests/${folder}/*_check.py)
  set(program ${zx_check_program_${folder}})
  foreach(source IN LISTS checks)
    cmake_path(GET source STEM stem)
    zx_add_check(${folder}/${stem} ${source} ${program} --quick)
    zx_add_check(${folder}/${stem}.slow ${source} ${program})
    set_tests_properties(${folder}/${stem}.slow PROPERTIES LABELS slow
                         TIMEOUT 1800)
  endforeach()
endforeach()
