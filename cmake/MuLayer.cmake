# The layers of docs/architecture.md: platform, json, common and host, each an object library.
#
# Include lines name the folder ("json/json_value.h"), so one include path at the top of the tree would show every
# layer to every other. Instead each layer gets a tree that holds a link to its own folder and nothing else, and a
# target sees the trees of the targets it links: an include that points up finds no file.

add_library(mu_warnings INTERFACE)
target_compile_options(mu_warnings INTERFACE -Wall -Wextra -Wpedantic -Wconversion -Wshadow -Werror)

# mu_include_tree(<target> <scope> <path>...): lets target include the given files or folders by their full names.
function(mu_include_tree target scope)
    set(tree "${PROJECT_BINARY_DIR}/layers/${target}")
    foreach(path IN LISTS ARGN)
        get_filename_component(parent "${tree}/${path}" DIRECTORY)
        file(MAKE_DIRECTORY "${parent}")
        if(NOT IS_SYMLINK "${tree}/${path}")
            file(CREATE_LINK "${PROJECT_SOURCE_DIR}/${path}" "${tree}/${path}" SYMBOLIC)
        endif()
    endforeach()
    target_include_directories(${target} ${scope} "$<BUILD_INTERFACE:${tree}>")
endfunction()

# mu_layer(<target> <folder> SOURCES <file>... [LINK <target>...] [PRIVATE_LINK <target>...])
function(mu_layer target folder)
    cmake_parse_arguments(LAYER "" "" "SOURCES;LINK;PRIVATE_LINK" ${ARGN})
    add_library(${target} OBJECT ${LAYER_SOURCES})
    mu_include_tree(${target} PUBLIC ${folder})
    target_link_libraries(${target} PUBLIC ${LAYER_LINK} PRIVATE ${LAYER_PRIVATE_LINK} mu_warnings)
endfunction()

# mu_show_layers(<library> <layer>...): lets those who link the library include what these layers contain.
function(mu_show_layers library)
    foreach(layer IN LISTS ARGN)
        target_include_directories(${library} INTERFACE "$<BUILD_INTERFACE:${PROJECT_BINARY_DIR}/layers/${layer}>")
    endforeach()
endfunction()
