# zyrstd_add_test(NAME <program> SOURCES <file>... [LABELS <label>...]
#                 [DEFINITIONS <definition>...] [INCLUDES <directory>...]
#                 [LIBRARIES <library>...] [DEPENDS <target>...])
#
# One GoogleTest program and its ctest entry. A program whose sources start threads gets the
# label "threads"; a ThreadSanitizer build compiles only those sources, since it runs nothing
# else. Every program is recorded in the test manifest that the layering test reads.
function(zyrstd_add_test)
  cmake_parse_arguments(ARG "" "NAME" "SOURCES;LABELS;DEFINITIONS;INCLUDES;LIBRARIES;DEPENDS" ${ARGN})
  set(labels ${ARG_LABELS})
  set(threaded)
  foreach(source IN LISTS ARG_SOURCES)
    file(STRINGS ${CMAKE_CURRENT_SOURCE_DIR}/${source} uses_threads
         REGEX "std::thread|std::jthread|boost::thread|std::async")
    if(uses_threads)
      list(APPEND threaded ${source})
    endif()
  endforeach()
  if(threaded)
    list(APPEND labels threads)
  endif()
  set(sources ${ARG_SOURCES})
  if(ZYRSTD_SANITIZE STREQUAL "thread")
    if(NOT threaded)
      return()
    endif()
    set(sources ${threaded})
  endif()

  add_executable(${ARG_NAME} ${sources})
  target_link_libraries(${ARG_NAME} PRIVATE zyrstd_testmain ${ARG_LIBRARIES})
  if(ARG_DEFINITIONS)
    target_compile_definitions(${ARG_NAME} PRIVATE ${ARG_DEFINITIONS})
  endif()
  if(ARG_INCLUDES)
    target_include_directories(${ARG_NAME} PRIVATE ${ARG_INCLUDES})
  endif()
  if(ARG_DEPENDS)
    add_dependencies(${ARG_NAME} ${ARG_DEPENDS})
  endif()
  # Shuffled, so that no test leans on what an earlier one left behind.
  add_test(NAME ${ARG_NAME} COMMAND ${ARG_NAME} --gtest_shuffle)
  set_tests_properties(${ARG_NAME} PROPERTIES TIMEOUT 300
    ENVIRONMENT "ZYRSTD_TOOL=$<TARGET_FILE:zyrstd>")
  if(labels)
    set_tests_properties(${ARG_NAME} PROPERTIES LABELS "${labels}")
  endif()

  list(TRANSFORM sources PREPEND "${CMAKE_CURRENT_SOURCE_DIR}/")
  list(JOIN sources "," sources)
  set_property(GLOBAL APPEND PROPERTY ZYRSTD_TEST_MANIFEST "${ARG_NAME}:${sources}")
endfunction()
