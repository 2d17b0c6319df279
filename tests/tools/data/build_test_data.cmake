# Builds the shared data set unless the one at hand is newer than the program.
#   cmake -DPROGRAM=... -DSOURCE=... -DOUT=... -P build_test_data.cmake
if(NOT EXISTS "${SOURCE}")
    message("SKIPPED: ${SOURCE} is not installed")
    return()
endif()
if(EXISTS "${OUT}/MANIFEST.txt" AND "${OUT}/MANIFEST.txt" IS_NEWER_THAN "${PROGRAM}"
   AND EXISTS "${OUT}/TSLdata120.dat" AND EXISTS "${OUT}/TSLdata121.dat"
   AND EXISTS "${OUT}/TSLdata122.dat" AND EXISTS "${OUT}/TSLdata512.dat"
   AND EXISTS "${OUT}/IP23M3_512_FadeOut")
    return()
endif()
execute_process(COMMAND "${PROGRAM}" all --out "${OUT}" COMMAND_ERROR_IS_FATAL ANY)
