# Writes autocli's manual page and bash completion script with the autocli just built, on
# its demo host: none of the builder's own settings reach it (no state file, host choice,
# journal or plug-in folder), and its home is a folder of the build tree.
# Run as: cmake -DAUTOCLI=<program> -DBINARY_DIR=<build tree> -P GenerateDocs.cmake

set(home "${BINARY_DIR}/autocli-docs-home")
file(REMOVE_RECURSE "${home}")
file(MAKE_DIRECTORY "${home}")
foreach(name AUTOCLI_STATE AUTOCLI_HOST AUTOCLI_JOURNAL AUTOCLI_PLUGIN_PATH AUTOCLI_LINUX_DIR AUTOCLI_LOCK_TIMEOUT)
    unset(ENV{${name}})
endforeach()
set(ENV{HOME} "${home}")
set(ENV{XDG_STATE_HOME} "${home}/state")

function(generate output)
    get_filename_component(folder "${output}" DIRECTORY)
    file(MAKE_DIRECTORY "${folder}")
    execute_process(COMMAND "${AUTOCLI}" ${ARGN}
                    OUTPUT_FILE "${output}.new" ERROR_VARIABLE errors RESULT_VARIABLE result)
    if(NOT result EQUAL 0)
        file(REMOVE "${output}.new")
        message(FATAL_ERROR "autocli ${ARGN} failed (${result}): ${errors}")
    endif()
    file(RENAME "${output}.new" "${output}")
endfunction()

generate("${BINARY_DIR}/share/man/man1/autocli.1" --man-page)
generate("${BINARY_DIR}/share/bash-completion/completions/autocli" --completion bash)
file(REMOVE_RECURSE "${home}")
