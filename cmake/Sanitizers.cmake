# ASSAY_SANITIZE=address,undefined or thread builds everything with those sanitizers.
if(ASSAY_SANITIZE)
  add_compile_options(-fsanitize=${ASSAY_SANITIZE} -fno-omit-frame-pointer -g)
  add_link_options(-fsanitize=${ASSAY_SANITIZE})
  if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    # GCC reports false positives in instrumented standard library code (std::regex).
    add_compile_options(-Wno-maybe-uninitialized)
  endif()
  if(ASSAY_SANITIZE MATCHES "undefined")
    add_compile_options(-fno-sanitize-recover=undefined)
  endif()
endif()
