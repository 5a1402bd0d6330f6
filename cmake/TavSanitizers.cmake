# Sanitizers apply to every target of a native build, so that the module, the
# platform layer and the tests are all instrumented together.
if(TAV_SANITIZE STREQUAL "address-undefined")
  # An interface's enumeration carries whatever 32-bit value a client
  # passes; the operations check the range themselves (GCC does not assume it
  # without -fstrict-enums), so a value outside the enumerators is no fault.
  add_compile_options(-fsanitize=address,undefined -fno-sanitize=enum -fno-omit-frame-pointer
                      -fno-sanitize-recover=undefined)
  add_link_options(-fsanitize=address,undefined)
elseif(TAV_SANITIZE STREQUAL "thread")
  add_compile_options(-fsanitize=thread -fno-omit-frame-pointer)
  add_link_options(-fsanitize=thread)
elseif(NOT TAV_SANITIZE STREQUAL "")
  message(FATAL_ERROR "Unknown TAV_SANITIZE value: ${TAV_SANITIZE}")
endif()
