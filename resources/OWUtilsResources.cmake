# owutils_add_resource_module: builds one resource module from text sources.
#
#   owutils_add_resource_module(NAME EngineRes LANGUAGE 409
#     STRINGS EngineRes/EngineRes409.strings   # string table (optional)
#     MESSAGES AppMsg/AppMsg409.mc             # message table (optional)
#     OEM EngineRes/EngineRes.oem              # OEM records, engine modules only (optional)
#     [TARGET name] [OUTPUT_DIRECTORY dir] [NO_INSTALL])
#
# gives OW<NAME><LANGUAGE>.so (OWEngineRes409.so) in OUTPUT_DIRECTORY (default: beside
# libOWUtils, in <build>/lib), installed beside the library unless NO_INSTALL is given. LANGUAGE
# is the Windows language identifier in lower-case hexadecimal without leading zeros, as the
# library builds the file name (409 English, 407 German, 804 Simplified Chinese...). The text
# formats are described in owres_gen.py. The target is called TARGET, by default
# OWResources_<NAME><LANGUAGE>. An installed library carries this file and the generator in
# <prefix>/lib/cmake/OWUtils: include(${OWUtils_DIR}/OWUtilsResources.cmake).
find_package(Python3 REQUIRED COMPONENTS Interpreter)

# The interpreter target is local to this folder; modules may be built from any folder.
set(OWUTILS_RESOURCE_PYTHON ${Python3_EXECUTABLE} CACHE INTERNAL "")
set(OWUTILS_RESOURCE_GENERATOR ${CMAKE_CURRENT_LIST_DIR}/owres_gen.py CACHE INTERNAL "")
# The public headers: beside this file in the source tree, or in the installed include folder.
if(EXISTS ${CMAKE_CURRENT_LIST_DIR}/../include/owutils/ResourceModule.h)
  get_filename_component(_owutils_include ${CMAKE_CURRENT_LIST_DIR}/../include ABSOLUTE)
else()
  get_filename_component(_owutils_include ${CMAKE_CURRENT_LIST_DIR}/../../../include ABSOLUTE)
endif()
set(OWUTILS_RESOURCE_INCLUDE_DIR ${_owutils_include} CACHE INTERNAL "")
include(GNUInstallDirs)

function(owutils_add_resource_module)
  cmake_parse_arguments(PARSE_ARGV 0 ARG "NO_INSTALL"
    "NAME;LANGUAGE;STRINGS;MESSAGES;OEM;TARGET;OUTPUT_DIRECTORY" "")
  if(ARG_UNPARSED_ARGUMENTS)
    message(FATAL_ERROR "owutils_add_resource_module: unknown arguments ${ARG_UNPARSED_ARGUMENTS}")
  endif()
  if(NOT ARG_NAME MATCHES "^[A-Za-z][A-Za-z0-9_]*$")
    message(FATAL_ERROR "owutils_add_resource_module: NAME must be a plain base name, got '${ARG_NAME}'")
  endif()
  if(NOT ARG_LANGUAGE MATCHES "^[1-9a-f][0-9a-f]*$")
    message(FATAL_ERROR "owutils_add_resource_module: LANGUAGE must be lower-case hexadecimal "
                        "without leading zeros (409, 407, 804...), got '${ARG_LANGUAGE}'")
  endif()
  if(NOT ARG_STRINGS AND NOT ARG_MESSAGES AND NOT ARG_OEM)
    message(FATAL_ERROR "owutils_add_resource_module: ${ARG_NAME}${ARG_LANGUAGE} has no sources")
  endif()

  set(module OW${ARG_NAME}${ARG_LANGUAGE})
  set(target ${ARG_TARGET})
  if(NOT target)
    set(target OWResources_${ARG_NAME}${ARG_LANGUAGE})
  endif()
  set(output_dir ${ARG_OUTPUT_DIRECTORY})
  if(NOT output_dir)
    set(output_dir ${CMAKE_BINARY_DIR}/lib)
  endif()

  set(generated ${CMAKE_CURRENT_BINARY_DIR}/${target}.cpp)
  set(args --language ${ARG_LANGUAGE} --output ${generated})
  set(depends ${OWUTILS_RESOURCE_GENERATOR})
  foreach(kind STRINGS MESSAGES OEM)
    if(ARG_${kind})
      get_filename_component(source ${ARG_${kind}} ABSOLUTE)
      string(TOLOWER ${kind} option)
      list(APPEND args --${option} ${source})
      list(APPEND depends ${source})
    endif()
  endforeach()
  if(ARG_OEM)
    list(APPEND args --oem-header ${OWUTILS_RESOURCE_INCLUDE_DIR}/owutils/LmOem.h)
    list(APPEND depends ${OWUTILS_RESOURCE_INCLUDE_DIR}/owutils/LmOem.h)
  endif()
  list(APPEND depends ${OWUTILS_RESOURCE_INCLUDE_DIR}/owutils/ResourceModule.h)

  add_custom_command(OUTPUT ${generated}
    COMMAND ${OWUTILS_RESOURCE_PYTHON} ${OWUTILS_RESOURCE_GENERATOR} ${args}
    DEPENDS ${depends}
    COMMENT "Generating resource module ${module}"
    VERBATIM)
  add_library(${target} MODULE ${generated})
  target_include_directories(${target} PRIVATE ${OWUTILS_RESOURCE_INCLUDE_DIR})
  set_target_properties(${target} PROPERTIES
    OUTPUT_NAME ${module}
    PREFIX ""
    LIBRARY_OUTPUT_DIRECTORY ${output_dir})
  if(NOT ARG_NO_INSTALL)
    install(TARGETS ${target} LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
  endif()
endfunction()
