# The distribution's hardening flags for an optimised Linux build: checked C functions, stack protector,
# and relocations that are read-only after the start. A package build passes them by itself.
if(CMAKE_BUILD_TYPE STREQUAL "Release" AND NOT WIN32 AND NOT ASSAY_SANITIZE)
  add_compile_options(-U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2 -fstack-protector-strong
    -fstack-clash-protection)
  add_link_options(-Wl,-z,relro -Wl,-z,now)
endif()
