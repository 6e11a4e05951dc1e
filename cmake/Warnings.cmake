# Common compile options for every target of the project: warnings are errors, no contraction of
# floating-point expressions into fused operations, never fast-math.
add_library(ulvetta_options INTERFACE)
target_compile_options(ulvetta_options INTERFACE
  -Wall -Wextra -Werror -ffp-contract=off)
if(WIN32)
  # M_PI and friends under strict C++17 with the mingw-w64 headers.
  target_compile_definitions(ulvetta_options INTERFACE _USE_MATH_DEFINES)
endif()

# Sanitizer builds: ULVETTA_SANITIZE is "address" (AddressSanitizer + UndefinedBehaviorSanitizer) or "thread".
set(ULVETTA_SANITIZE "" CACHE STRING "Sanitizer build: address or thread")
if(ULVETTA_SANITIZE STREQUAL "address")
  target_compile_options(ulvetta_options INTERFACE -fsanitize=address,undefined -fno-sanitize-recover=all
                         -fno-omit-frame-pointer)
  target_link_options(ulvetta_options INTERFACE -fsanitize=address,undefined)
elseif(ULVETTA_SANITIZE STREQUAL "thread")
  target_compile_options(ulvetta_options INTERFACE -fsanitize=thread -fno-omit-frame-pointer)
  target_link_options(ulvetta_options INTERFACE -fsanitize=thread)
endif()
