# ASSAY_SANITIZE=address,undefined or thread builds everything with those sanitizers.
if(ASSAY_SANITIZE)
  add_compile_options(-fsanitize=${ASSAY_SANITIZE} -fno-omit-frame-pointer -g)
  add_link_options(-fsanitize=${ASSAY_SANITIZE})
  if(ASSAY_SANITIZE MATCHES "undefined")
    add_compile_options(-fno-sanitize-recover=undefined)
  endif()
endif()
