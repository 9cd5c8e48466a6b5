# Compiler flags shared by every target.
add_compile_options(-Wall -Wextra -Wno-unused-parameter)

if(LUMEK_SANITIZE OR LUMEK_FUZZ)
  add_compile_options(-fsanitize=address,undefined -fno-omit-frame-pointer -fno-sanitize-recover=undefined)
  add_link_options(-fsanitize=address,undefined)
endif()
if(LUMEK_FUZZ)
  # Every library the fuzz targets reach feeds coverage back to the fuzzer.
  add_compile_options(-fsanitize=fuzzer-no-link)
endif()

# Adds a library of one folder: lumek_library(NAME SOURCES ... DEPENDS ...)
function(lumek_library name)
  cmake_parse_arguments(ARG "" "" "SOURCES;DEPENDS" ${ARGN})
  add_library(${name} STATIC ${ARG_SOURCES})
  target_link_libraries(${name} PUBLIC ${ARG_DEPENDS})
endfunction()

# Adds every child folder of the current folder that has a CMakeLists.txt, in name order.
# A library that needs Qt starts its CMakeLists.txt with lumek_requires_qt().
function(lumek_add_subdirectories)
  file(GLOB children LIST_DIRECTORIES true RELATIVE ${CMAKE_CURRENT_SOURCE_DIR} ${CMAKE_CURRENT_SOURCE_DIR}/*)
  list(SORT children)
  foreach(child ${children})
    if(IS_DIRECTORY ${CMAKE_CURRENT_SOURCE_DIR}/${child} AND EXISTS ${CMAKE_CURRENT_SOURCE_DIR}/${child}/CMakeLists.txt)
      add_subdirectory(${child})
    endif()
  endforeach()
endfunction()

# Leaves the calling CMakeLists.txt in the fuzz build, which has no Qt.
macro(lumek_requires_qt)
  if(LUMEK_FUZZ)
    return()
  endif()
  set(CMAKE_AUTOMOC ON)
  set(CMAKE_AUTORCC ON)
endmacro()

# A GoogleTest executable whose cases CTest runs one by one:
# lumek_test(NAME SOURCES ... DEPENDS ... [LABELS ...])
function(lumek_test name)
  cmake_parse_arguments(ARG "" "" "SOURCES;DEPENDS;LABELS" ${ARGN})
  add_executable(${name} ${ARG_SOURCES})
  target_link_libraries(${name} PRIVATE ${ARG_DEPENDS} GTest::gtest GTest::gtest_main GTest::gmock)
  set_target_properties(${name} PROPERTIES RUNTIME_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/tests)
  include(GoogleTest)
  set(properties TIMEOUT 300)
  if(ARG_LABELS)
    list(APPEND properties LABELS "${ARG_LABELS}")
  endif()
  gtest_discover_tests(${name} DISCOVERY_TIMEOUT 60 PROPERTIES ${properties})
endfunction()
