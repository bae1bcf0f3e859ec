# Warning and sanitizer flags shared by every target of the project.
add_library(kest_compile_options INTERFACE)
target_compile_options(kest_compile_options INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wcast-align -Wformat=2 -Wundef
  $<$<BOOL:${KEST_WERROR}>:-Werror>)

# The large-file interfaces on 32-bit targets (ARMv7): without them stat, statvfs and readdir
# fail with EOVERFLOW on large inode numbers, block counts and directory offsets. On 64-bit
# targets these interfaces are the only ones.
add_compile_definitions(_FILE_OFFSET_BITS=64)

if(KEST_SANITIZE)
  set(KEST_SANITIZE_FLAGS -fsanitize=${KEST_SANITIZE} -fno-omit-frame-pointer
      -fno-sanitize-recover=all)
  add_compile_options(${KEST_SANITIZE_FLAGS})
  add_link_options(${KEST_SANITIZE_FLAGS})
endif()

# kest_internal_library(NAME SOURCES...): a static, position-independent library of the
# plug-in. Its sources see the public headers and the src/ tree.
function(kest_internal_library name)
  add_library(${name} STATIC ${ARGN})
  target_include_directories(${name} PUBLIC ${PROJECT_SOURCE_DIR}/include ${PROJECT_SOURCE_DIR}/src)
  target_link_libraries(${name} PUBLIC kest_compile_options)
endfunction()
