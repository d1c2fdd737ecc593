# korrin_install_pc_file(name): configures cmake/<name>.pc.in into the build
# tree and installs it where pkg-config looks, under the library folder.
#
# The file finds its prefix from where it lies (${pcfiledir}), so a tree
# installed with `cmake --install --prefix P` works from P whatever prefix the
# build was configured with. Templates use @KORRIN_PC_PREFIX@,
# @KORRIN_PC_LIBDIR@, @KORRIN_PC_INCLUDEDIR@ and @KORRIN_PC_VERSION@.
include(GNUInstallDirs)

function(korrin_install_pc_file name)
  file(RELATIVE_PATH up "${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig" "${CMAKE_INSTALL_PREFIX}")
  string(REGEX REPLACE "/$" "" up "${up}")
  set(KORRIN_PC_PREFIX "\${pcfiledir}/${up}")
  # An absolute folder given at configure time stays where it was given.
  foreach(dir LIBDIR INCLUDEDIR)
    if(IS_ABSOLUTE "${CMAKE_INSTALL_${dir}}")
      set(KORRIN_PC_${dir} "${CMAKE_INSTALL_${dir}}")
    else()
      set(KORRIN_PC_${dir} "\${prefix}/${CMAKE_INSTALL_${dir}}")
    endif()
  endforeach()
  set(KORRIN_PC_VERSION "${PROJECT_VERSION}")
  if(NOT KORRIN_PC_VERSION)
    set(KORRIN_PC_VERSION 0)
  endif()
  configure_file(${PROJECT_SOURCE_DIR}/cmake/${name}.pc.in ${PROJECT_BINARY_DIR}/${name}.pc @ONLY)
  install(FILES ${PROJECT_BINARY_DIR}/${name}.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
endfunction()
