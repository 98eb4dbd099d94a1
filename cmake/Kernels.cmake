# The library with the kernels of one instruction set whatever the processor, for tests and measurements: the same objects but for
# those that choose. Programs get it before the library itself where LD_LIBRARY_PATH names its folder, kernels/SET.
function(kel_library_of set)
  add_library(kel_${set} SHARED EXCLUDE_FROM_ALL
    "$<FILTER:$<TARGET_OBJECTS:kel>,EXCLUDE,(kelImage_Kernels|kelMatInliers)[.]cpp>"
    ${PROJECT_SOURCE_DIR}/kelImage/src/kelImage_Kernels.cpp ${PROJECT_SOURCE_DIR}/kelMat/src/kelMatInliers.cpp)
  target_include_directories(kel_${set} PRIVATE ${PROJECT_SOURCE_DIR}/common)
  target_compile_definitions(kel_${set} PRIVATE KEL_KERNELS=${set})
  target_link_libraries(kel_${set} PRIVATE kel_flags)
  target_link_options(kel_${set} PRIVATE $<TARGET_PROPERTY:kel,LINK_OPTIONS>)
  set_target_properties(kel_${set} PROPERTIES OUTPUT_NAME kel SOVERSION ${PROJECT_VERSION_MAJOR}
    CXX_VISIBILITY_PRESET hidden LIBRARY_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/kernels/${set})
endfunction()
foreach(set IN LISTS kel_kernel_sets)
  kel_library_of(${set})
endforeach()
