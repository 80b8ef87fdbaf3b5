# Reads the PLY files that other tools wrote (kept outside the repository, next to it) and
# compares every value with what an independent reader saw. Skipped when the corpus is
# missing, except on CI, where a missing corpus must not pass unnoticed.
find_package(Python3 COMPONENTS Interpreter REQUIRED)

add_test(NAME ply.corpus
  COMMAND ${Python3_EXECUTABLE} ${CMAKE_CURRENT_LIST_DIR}/check_plycorpus.py
          --scenetool $<TARGET_FILE:scenetool>
          --corpus ${PROJECT_SOURCE_DIR}/../shared/plycorpus)
set_tests_properties(ply.corpus PROPERTIES SKIP_RETURN_CODE 77)
# CI=true turns a missing corpus into a failure. CTest passes its own environment on; the
# value seen at configure time is set as well, for test runs started without it.
if(DEFINED ENV{CI})
  set_tests_properties(ply.corpus PROPERTIES ENVIRONMENT "CI=$ENV{CI}")
endif()
