# mu_catalogue(<target> <file.po> <file.mo>): compiles a message catalogue, refusing placeholders that do not match.
function(mu_catalogue target po mo)
    find_program(MU_MSGFMT msgfmt REQUIRED)
    get_filename_component(folder "${mo}" DIRECTORY)
    add_custom_command(OUTPUT "${mo}"
        COMMAND "${CMAKE_COMMAND}" -E make_directory "${folder}"
        COMMAND "${MU_MSGFMT}" --check-format --output-file "${mo}" "${po}"
        DEPENDS "${po}"
        COMMENT "Compiling the catalogue ${po}"
        VERBATIM)
    add_custom_target(${target} ALL DEPENDS "${mo}")
endfunction()
