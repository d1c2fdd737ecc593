# korrin-sim's device roots: without --root a run (shell, demo) leaves nothing
# in $TMPDIR; with --root the phone outlives the run beside its database.
# KORRIN_SIM is a list: korrin-sim, after an emulator in a cross build.
file(REMOVE_RECURSE ${WORK})
file(MAKE_DIRECTORY ${WORK}/tmp)
set(ENV{TMPDIR} ${WORK}/tmp)
set(ENV{HOME} ${WORK})
foreach(mode "run;${SCRIPTS}/first.ksim" "shell" "demo")
  execute_process(COMMAND ${KORRIN_SIM} ${mode} INPUT_FILE ${SCRIPTS}/first.ksim
                  OUTPUT_QUIET RESULT_VARIABLE status)
  file(GLOB left ${WORK}/tmp/*)
  if(NOT status EQUAL 0 OR left)
    message(FATAL_ERROR "`korrin-sim ${mode}` ended with ${status}, leaving: ${left}")
  endif()
endforeach()
foreach(script first second)
  execute_process(COMMAND ${KORRIN_SIM} run --root ${WORK}/root ${SCRIPTS}/${script}.ksim
                  RESULT_VARIABLE status)
  if(NOT status EQUAL 0)
    message(FATAL_ERROR "${script}.ksim on the kept root ended with ${status}")
  endif()
endforeach()
