# tonewright_add_plugin(NAME source...): a media plug-in NAME.so on top of tonewright::plugin_support. Link the libraries
# it needs with target_link_libraries.
function(tonewright_add_plugin name)
    add_library(${name} MODULE ${ARGN})
    target_link_libraries(${name} PRIVATE tonewright::plugin_support)
    # The entry point is the only symbol that is exported.
    set_target_properties(${name} PROPERTIES PREFIX "" CXX_VISIBILITY_PRESET hidden VISIBILITY_INLINES_HIDDEN ON)
endfunction()
