# Shared build rules: warnings, sanitizers, and the helpers every subsystem
# folder uses so that adding a source or test file needs no CMake edit.

add_library(tav_options INTERFACE)
target_compile_options(tav_options INTERFACE -Wall -Wextra -Werror)
# GCC 12 at -O2 and above reports -Wrestrict inside std::string whenever a
# literal is prepended to a string (GCC bug 105329): a false positive in the
# standard library, not in our code.
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU" AND CMAKE_CXX_COMPILER_VERSION VERSION_LESS 13)
  target_compile_options(tav_options INTERFACE -Wno-restrict)
endif()
target_include_directories(tav_options INTERFACE ${PROJECT_SOURCE_DIR}/src)
# Asio decides per translation unit, from whether a standard header came
# first, whether to use aligned_alloc; two files deciding differently free
# memory with the wrong function. Deciding once for the whole program avoids it.
target_compile_definitions(tav_options INTERFACE ASIO_STANDALONE ASIO_DISABLE_STD_ALIGNED_ALLOC)

if(TAV_SANITIZE)
  target_compile_options(tav_options INTERFACE
    -fsanitize=address,undefined -fno-sanitize-recover=undefined -fno-omit-frame-pointer)
  target_link_options(tav_options INTERFACE -fsanitize=address,undefined)
endif()

if(TAV_FUZZ)
  if(NOT CMAKE_CXX_COMPILER_ID MATCHES "Clang")
    message(FATAL_ERROR "TAV_FUZZ needs clang (libFuzzer)")
  endif()
  target_compile_options(tav_options INTERFACE
    -fsanitize=fuzzer-no-link,address,undefined -fno-sanitize-recover=undefined -fno-omit-frame-pointer)
  target_link_options(tav_options INTERFACE -fsanitize=address,undefined)
endif()

# tav_subsystem(NAME DEPS ...): builds every non-test .cpp of the calling
# folder into the static library NAME and every *_test.cpp into NAME_tests,
# registered with ctest. MATCHING or EXCLUDING (a regular expression on the
# file name) splits a folder into two libraries, as when only some of its
# files may pull in a heavy dependency.
function(tav_subsystem name)
  cmake_parse_arguments(ARG "" "MATCHING;EXCLUDING" "DEPS;TEST_DEPS" ${ARGN})
  file(GLOB all_sources CONFIGURE_DEPENDS ${CMAKE_CURRENT_SOURCE_DIR}/*.cpp)
  if(ARG_MATCHING)
    list(FILTER all_sources INCLUDE REGEX "/${ARG_MATCHING}[^/]*$")
  endif()
  if(ARG_EXCLUDING)
    list(FILTER all_sources EXCLUDE REGEX "/${ARG_EXCLUDING}[^/]*$")
  endif()
  set(lib_sources ${all_sources})
  list(FILTER lib_sources EXCLUDE REGEX "_test\\.cpp$")
  set(test_sources ${all_sources})
  list(FILTER test_sources INCLUDE REGEX "_test\\.cpp$")

  if(lib_sources)
    add_library(${name} STATIC ${lib_sources})
    target_link_libraries(${name} PUBLIC tav_options ${ARG_DEPS})
  else()
    add_library(${name} INTERFACE)
    target_link_libraries(${name} INTERFACE tav_options ${ARG_DEPS})
  endif()

  if(TAV_TESTS AND test_sources)
    add_executable(${name}_tests ${test_sources})
    target_link_libraries(${name}_tests PRIVATE ${name} ${ARG_TEST_DEPS} GTest::gmock GTest::gtest_main)
    # Test data written by independent programs, kept in the repository.
    # Tests read TAV_TESTDATA_DIR from the environment (set here for ctest)
    # or fall back to the compiled-in path when run by hand.
    set(testdata ${PROJECT_SOURCE_DIR}/testdata)
    target_compile_definitions(${name}_tests PRIVATE
      TAV_SOURCE_DIR="${PROJECT_SOURCE_DIR}" TAV_TESTDATA_DIR_DEFAULT="${testdata}")
    gtest_discover_tests(${name}_tests DISCOVERY_TIMEOUT 60
      PROPERTIES ENVIRONMENT "TAV_TESTDATA_DIR=${testdata}")
  endif()
endfunction()
