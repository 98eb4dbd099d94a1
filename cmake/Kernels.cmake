# The libraries with the kernels of one instruction set whatever the processor, for tests and measurements: the same objects but for
# those that choose. Programs get them before the libraries themselves where LD_LIBRARY_PATH names their folder, kernels/SET.
function(kel_library_of set table library) # and the sources that choose, which take `table`
  set(choice ${ARGN})
  list(TRANSFORM choice REPLACE ".*/(.*)[.]cpp" "\\1" OUTPUT_VARIABLE names)
  list(JOIN names "|" names)
  list(TRANSFORM choice PREPEND ${PROJECT_SOURCE_DIR}/)
  add_library(${library}_${set} SHARED EXCLUDE_FROM_ALL "$<FILTER:$<TARGET_OBJECTS:${library}>,EXCLUDE,/(${names})[.]cpp>" ${choice})
  target_include_directories(${library}_${set} PRIVATE ${PROJECT_SOURCE_DIR}/common)
  target_compile_definitions(${library}_${set} PRIVATE KEL_KERNELS=${table})
  target_link_libraries(${library}_${set} PRIVATE kel_flags)
  target_link_options(${library}_${set} PRIVATE $<TARGET_PROPERTY:${library},LINK_OPTIONS>)
  set_target_properties(${library}_${set} PROPERTIES OUTPUT_NAME ${library} SOVERSION ${PROJECT_VERSION_MAJOR}
    CXX_VISIBILITY_PRESET hidden LIBRARY_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/kernels/${set})
endfunction()
foreach(set IN LISTS kel_kernel_sets)
  kel_library_of(${set} ${set} kel kelImage/src/kelImage_Kernels.cpp kelMat/src/kelMatInliers.cpp)
  set(table kKernelsAvx2) # the widest that registration has
  if(set STREQUAL "sse41")
    set(table kKernelsSse)
  endif()
  kel_library_of(${set} ${table} kelRegister kelRegister/src/kelRegisterKernels.cpp)
  target_link_libraries(kelRegister_${set} PRIVATE kel)
endforeach()
