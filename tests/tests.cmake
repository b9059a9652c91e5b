# Bytes of Analysis Workspace for the "-workspace" run of each suite.
set(TW_TEST_WORKSPACE_BYTES 268435456)

function(tw_add_test_dir name dir)
  file(GLOB all ${dir}/*.cpp)
  file(GLOB internal ${dir}/*_internal_test.cpp)
  set(external ${all})
  if(internal)
    list(REMOVE_ITEM external ${internal})
  endif()
  # Suites whose name ends in "threads" run under ThreadSanitizer; the rest under ASan/UBSan.
  if(TW_SANITIZE STREQUAL "thread" AND NOT name MATCHES "threads$")
    return()
  endif()
  if(external)
    tw_add_test_program(${name} "${external}" twanlys)
  endif()
  if(internal)
    tw_add_test_program(${name}_internal "${internal}" twanlys_obj)
  endif()
endfunction()

function(tw_add_test_program name sources lib)
  add_executable(test_${name} ${sources})
  target_link_libraries(test_${name} PRIVATE tw_testmain ${lib})
  target_compile_options(test_${name} PRIVATE ${TW_WARNINGS} -Wno-conversion)
  target_compile_definitions(test_${name} PRIVATE
    TW_SOURCE_DIR="${PROJECT_SOURCE_DIR}" TW_BINARY_DIR="${CMAKE_BINARY_DIR}")
  add_dependencies(test_${name} tw_no_host tw_fake_host twanlys)
  add_test(NAME ${name} COMMAND test_${name})
  set_tests_properties(${name} PROPERTIES TIMEOUT 1200)
  # Every suite runs a second time with scratch memory served by the Analysis Workspace.
  add_test(NAME ${name}.workspace COMMAND test_${name})
  set_tests_properties(${name}.workspace PROPERTIES
    ENVIRONMENT "TW_TEST_WORKSPACE=${TW_TEST_WORKSPACE_BYTES}" TIMEOUT 1200)
endfunction()
