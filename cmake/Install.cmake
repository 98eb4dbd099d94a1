# Installation: headers under include/kel, the libraries, a relocatable CMake package and pkg-config files. Registration has components
# of its own, which may be left out.
install(TARGETS kel EXPORT kelTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT runtime NAMELINK_COMPONENT development
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT development)
install(FILES ${kel_headers} DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/kel COMPONENT development)

install(TARGETS kelRegister EXPORT kelRegisterTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT register_runtime NAMELINK_COMPONENT register_development
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT register_development)
install(FILES ${kelRegister_headers} DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/kel COMPONENT register_development)

set(kel_package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/kel)
install(EXPORT kelTargets NAMESPACE kel:: FILE kelTargets.cmake DESTINATION ${kel_package_dir} COMPONENT development)
install(EXPORT kelRegisterTargets NAMESPACE kel:: FILE kelRegisterTargets.cmake DESTINATION ${kel_package_dir}
  COMPONENT register_development)
configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/kelConfig.cmake.in ${PROJECT_BINARY_DIR}/kelConfig.cmake
  INSTALL_DESTINATION ${kel_package_dir})
write_basic_package_version_file(${PROJECT_BINARY_DIR}/kelConfigVersion.cmake COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/kelConfig.cmake ${PROJECT_BINARY_DIR}/kelConfigVersion.cmake
  DESTINATION ${kel_package_dir} COMPONENT development)

# Relative install folders make the .pc file relocatable through ${pcfiledir}; absolute ones are taken as they are.
set(kel_pc_dir ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
if(IS_ABSOLUTE ${kel_pc_dir})
  set(KEL_PC_PREFIX ${CMAKE_INSTALL_PREFIX})
else()
  file(RELATIVE_PATH kel_pc_up /prefix/${kel_pc_dir} /prefix)
  string(REGEX REPLACE "/$" "" kel_pc_up "${kel_pc_up}")
  set(KEL_PC_PREFIX "\${pcfiledir}/${kel_pc_up}")
endif()
foreach(dir LIBDIR INCLUDEDIR)
  if(IS_ABSOLUTE ${CMAKE_INSTALL_${dir}})
    set(KEL_PC_${dir} ${CMAKE_INSTALL_${dir}})
  else()
    set(KEL_PC_${dir} "\${prefix}/${CMAKE_INSTALL_${dir}}")
  endif()
endforeach()
configure_file(${PROJECT_SOURCE_DIR}/cmake/kel.pc.in ${PROJECT_BINARY_DIR}/kel.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/kel.pc DESTINATION ${kel_pc_dir} COMPONENT development)
configure_file(${PROJECT_SOURCE_DIR}/cmake/kelregister.pc.in ${PROJECT_BINARY_DIR}/kelregister.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/kelregister.pc DESTINATION ${kel_pc_dir} COMPONENT register_development)

# The programs, under names that leave "register" and the like to others, with man pages from what they say of themselves.
if(KEL_BUILD_EXAMPLES)
  find_program(KEL_HELP2MAN help2man)
  list(JOIN CMAKE_CROSSCOMPILING_EMULATOR " " kel_emulator)
  string(REGEX REPLACE "(.)$" "\\1 " kel_emulator "${kel_emulator}")
  foreach(program IN LISTS kel_programs)
    install(TARGETS ${program} RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT tools)
    install(CODE "set(bin \"\$ENV{DESTDIR}\${CMAKE_INSTALL_PREFIX}/${CMAKE_INSTALL_BINDIR}\")
      file(RENAME \${bin}/${program} \${bin}/kel-${program})" COMPONENT tools)
    if(KEL_HELP2MAN)
      set(page ${PROJECT_BINARY_DIR}/man/kel-${program}.1)
      add_custom_command(OUTPUT ${page} DEPENDS ${program}
        COMMAND ${CMAKE_COMMAND} -E create_symlink $<TARGET_FILE:${program}> ${PROJECT_BINARY_DIR}/man/bin/kel-${program}
        COMMAND ${KEL_HELP2MAN} --no-info --section 1 "--name=${kel_${program}_does}" --output ${page}
          "${kel_emulator}${PROJECT_BINARY_DIR}/man/bin/kel-${program}" VERBATIM)
      list(APPEND kel_pages ${page})
    endif()
  endforeach()
  if(KEL_HELP2MAN)
    file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/man/bin)
    add_custom_target(kel_man ALL DEPENDS ${kel_pages})
    install(FILES ${kel_pages} DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT tools)
  endif()
endif()
