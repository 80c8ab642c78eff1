# Installs the build in BINARY_DIR to PREFIX, which is emptied first.
file(REMOVE_RECURSE ${PREFIX})
execute_process(COMMAND ${CMAKE_COMMAND} --install ${BINARY_DIR} --prefix ${PREFIX}
  COMMAND_ERROR_IS_FATAL ANY)
