# Warning and sanitizer flags shared by every target of the project.
add_library(kest_compile_options INTERFACE)
target_compile_options(kest_compile_options INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wcast-align -Wformat=2 -Wundef
  $<$<BOOL:${KEST_WERROR}>:-Werror>)

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
