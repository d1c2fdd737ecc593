# A phone's database from the outside: the demo's layout exported, imported
# and checked, its log replayed, copies left alone, damage and writes refused.
# KORRIN_SIM is a list: korrin-sim, after an emulator in a cross build.
file(REMOVE_RECURSE ${WORK})
file(MAKE_DIRECTORY ${WORK})
set(db ${WORK}/root/opt/usr/apps/com.velmora.korrin/data/.game-data.db)

# Runs korrin-sim with ARGN; |status| must be |want| and stderr match |errors|.
function(sim want errors)
  execute_process(COMMAND ${KORRIN_SIM} ${ARGN} WORKING_DIRECTORY ${WORK}
                  OUTPUT_VARIABLE out ERROR_VARIABLE err RESULT_VARIABLE status)
  if(NOT status EQUAL want OR NOT err MATCHES "${errors}")
    message(FATAL_ERROR "korrin-sim ${ARGN}: ended ${status}, want ${want}:\n${out}${err}")
  endif()
  set(out "${out}" PARENT_SCOPE)
endfunction()

sim(0 "" run --root root ${DEMO} ${SCRIPTS}/dump-log.ksim)
file(WRITE ${WORK}/demo.log "${out}")
sim(0 "" replay-log demo.log)
file(READ ${SCRIPTS}/demo-replay.ksim want)
if(NOT out STREQUAL want)
  message(FATAL_ERROR "replay-log of the demo's log:\n${out}")
endif()

sim(0 "" export --db ${db} demo.json)
sim(0 "" import demo.json copy.db)
sim(0 "" tables --db ${db})
set(before "${out}")
sim(0 "" tables --db copy.db)
if(NOT out STREQUAL before)
  message(FATAL_ERROR "export then import changed the rows:\n${before}\n${out}")
endif()
sim(0 "" check --db copy.db)
sim(1 "holds a layout already" import demo.json copy.db)

# Changes go to a copy, unless --in-place.
sim(0 "" open copy.db ${SCRIPTS}/uninstall.ksim)
sim(0 "" tables --db copy.db)
if(NOT out STREQUAL before)
  message(FATAL_ERROR "open changed the file it opened")
endif()
sim(0 "" open copy.db ${SCRIPTS}/uninstall.ksim --in-place)
sim(0 "" tables --db copy.db)
if(out STREQUAL before OR out MATCHES "com.sandreel.dunecourier")
  message(FATAL_ERROR "open --in-place left the file as it was")
endif()

sim(1 "sql: only statements that read" sql --db copy.db DELETE FROM Boxes)
sim(1 "sql-two.ksim:1: sql: one statement only" open --root sql-root copy.db ${SCRIPTS}/sql-two.ksim)
sim(1 "broken.json:6: box 2 and box 3 share page 1 col 1 row 1" import ${SCRIPTS}/broken.json)
sim(1 "broken-syntax.json:4: not JSON" import ${SCRIPTS}/broken-syntax.json)
sim(1 "check: 4 problems:
schema: table Pages has columns the store does not make: extra TEXT
schema: table Boxes lacks columns: content TEXT
journal mode is wal; the launcher uses persist
integrity_check: row 1 missing from index BoxApp" check --db ${SCRIPTS}/broken.db)

# A field log in dlogutil's formats gives its jobs, and they play on the copy.
sim(0 "" replay-log ${SCRIPTS}/field.log)
file(READ ${SCRIPTS}/field-replay.ksim want)
string(REPLACE "${SCRIPTS}/" "" out "${out}")
if(NOT out STREQUAL want)
  message(FATAL_ERROR "replay-log of field.log:\n${out}")
endif()
sim(0 "" open copy.db ${SCRIPTS}/field-replay.ksim)
