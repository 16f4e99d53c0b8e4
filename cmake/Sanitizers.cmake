# One sanitizer family per build tree: 'address' gives AddressSanitizer together with
# UndefinedBehaviorSanitizer, 'thread' gives ThreadSanitizer.
if(ORV_SANITIZE STREQUAL "address")
  add_compile_options(-fsanitize=address,undefined -fno-omit-frame-pointer -fno-sanitize-recover=undefined)
  add_link_options(-fsanitize=address,undefined)
elseif(ORV_SANITIZE STREQUAL "thread")
  add_compile_options(-fsanitize=thread -fno-omit-frame-pointer)
  add_link_options(-fsanitize=thread)
elseif(NOT ORV_SANITIZE STREQUAL "")
  message(FATAL_ERROR "ORV_SANITIZE must be empty, 'address' or 'thread'")
endif()

# The fuzz build: every target gets the fuzzer's coverage instrumentation together with
# AddressSanitizer and UndefinedBehaviorSanitizer (undefined behaviour ends the target).
if(ORV_BUILD_FUZZERS)
  if(NOT CMAKE_CXX_COMPILER_ID MATCHES "Clang")
    message(FATAL_ERROR "ORV_BUILD_FUZZERS needs clang: configure with CXX=clang++")
  endif()
  if(NOT ORV_SANITIZE STREQUAL "")
    message(FATAL_ERROR "ORV_BUILD_FUZZERS brings its own sanitizers: leave ORV_SANITIZE empty")
  endif()
  add_compile_options(-fsanitize=fuzzer-no-link,address,undefined -fno-sanitize-recover=undefined
                      -fno-omit-frame-pointer -g)
  add_link_options(-fsanitize=address,undefined)
endif()
