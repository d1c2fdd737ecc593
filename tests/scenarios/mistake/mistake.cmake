# Plays lines-1-to-8.ksim (a mistake on line 7), then check.ksim on what is
# left. KORRIN_SIM is a list: korrin-sim, after an emulator in a cross build.
file(REMOVE_RECURSE ${ROOT})
execute_process(COMMAND ${KORRIN_SIM} run --root ${ROOT} ${SCRIPTS}/lines-1-to-8.ksim
                OUTPUT_QUIET ERROR_VARIABLE errors RESULT_VARIABLE status)
if(status EQUAL 0 OR NOT errors MATCHES "lines-1-to-8.ksim:7: ")
  message(FATAL_ERROR "a script with a mistake on line 7 ended with ${status}:\n${errors}")
endif()
execute_process(COMMAND ${KORRIN_SIM} run --root ${ROOT} ${SCRIPTS}/check.ksim
                RESULT_VARIABLE status)
if(NOT status EQUAL 0)
  message(FATAL_ERROR "the database is not what lines 1 to 6 made")
endif()
