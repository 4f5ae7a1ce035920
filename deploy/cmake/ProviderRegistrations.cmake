# Turns the provider table (deploy/providers.txt) into the registration files of both object
# managers, one pair per provider library, and into the C++ header that gives the module and the
# command-line tool the same names:
#   <OUTPUT_DIR>/sfcb/<library>.reg                      sfcb provider registration
#   <OUTPUT_DIR>/pegasus/<library>-registration.mof      OpenPegasus PG_ProviderModule & co.
#   <HEADER>                                             the table as C++ preprocessor lists
#
# bluelight_generate_registrations(
#     TABLE <file> OUTPUT_DIR <dir> VENDOR <text> VERSION <text> [HEADER <file>]
#     [SFCB_FILES <var>] [PEGASUS_FILES <var>] [LIBRARIES <var>])
#
# Runs at configure time; the table is a configure dependency, so editing it regenerates the
# files on the next build. Files are rewritten only when their text changes.

# Splits one table line into its six fields, or fails the configuration naming the line.
function(_bluelight_parse_table_line line number table out_prefix)
  string(REGEX REPLACE "[ \t]+" ";" fields "${line}")
  list(LENGTH fields count)
  if(NOT count EQUAL 6)
    message(FATAL_ERROR "${table}:${number}: expected 6 columns (class provider kinds library "
                        "namespaces symbol), found ${count}: ${line}")
  endif()
  list(GET fields 0 class)
  list(GET fields 1 provider)
  list(GET fields 2 kinds)
  list(GET fields 3 library)
  list(GET fields 4 namespaces)
  list(GET fields 5 symbol)
  foreach(name IN ITEMS "${class}" "${provider}" "${library}" "${symbol}")
    if(NOT name MATCHES "^[A-Za-z_][A-Za-z0-9_]*$")
      message(FATAL_ERROR "${table}:${number}: \"${name}\" is not a CIM or C identifier")
    endif()
  endforeach()
  string(REPLACE "," ";" kinds "${kinds}")
  foreach(kind IN LISTS kinds)
    if(NOT kind MATCHES "^(instance|association)$")
      message(FATAL_ERROR "${table}:${number}: unknown provider kind \"${kind}\" "
                          "(expected instance and/or association)")
    endif()
  endforeach()
  string(REPLACE "," ";" namespaces "${namespaces}")
  foreach(ns IN LISTS namespaces)
    if(NOT ns MATCHES "^[A-Za-z0-9_]+(/[A-Za-z0-9_]+)*$")
      message(FATAL_ERROR "${table}:${number}: \"${ns}\" is not a CIM namespace")
    endif()
  endforeach()
  if(NOT TARGET ${library})
    message(FATAL_ERROR "${table}:${number}: library \"${library}\" is not a target of this build")
  endif()
  # The object managers open lib<location>.so, so the location is the library's output name.
  get_target_property(location ${library} OUTPUT_NAME)
  if(NOT location)
    set(location ${library})
  endif()
  foreach(part class provider kinds library location namespaces symbol)
    set(${out_prefix}_${part} "${${part}}" PARENT_SCOPE)
  endforeach()
endfunction()

# "a;b" -> {"a", "b"} for MOF arrays.
function(_bluelight_mof_string_array out)
  set(items "")
  foreach(item IN LISTS ARGN)
    list(APPEND items "\"${item}\"")
  endforeach()
  list(JOIN items ", " joined)
  set(${out} "{${joined}}" PARENT_SCOPE)
endfunction()

function(bluelight_generate_registrations)
  cmake_parse_arguments(ARG ""
                        "TABLE;OUTPUT_DIR;VENDOR;VERSION;HEADER;SFCB_FILES;PEGASUS_FILES;LIBRARIES"
                        "" ${ARGN})
  foreach(required TABLE OUTPUT_DIR VENDOR VERSION)
    if(NOT ARG_${required})
      message(FATAL_ERROR "bluelight_generate_registrations: ${required} is required")
    endif()
  endforeach()
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${ARG_TABLE})
  file(RELATIVE_PATH table_name ${PROJECT_SOURCE_DIR} ${ARG_TABLE})

  file(STRINGS ${ARG_TABLE} lines)
  set(libraries "")
  set(classes "")
  set(symbols "")
  set(header_classes "")
  set(number 0)
  foreach(line IN LISTS lines)
    math(EXPR number "${number} + 1")
    string(STRIP "${line}" line)
    if(line STREQUAL "" OR line MATCHES "^#")
      continue()
    endif()
    _bluelight_parse_table_line("${line}" ${number} ${table_name} row)
    string(TOLOWER "${row_class}" class_key)
    if(class_key IN_LIST classes)
      message(FATAL_ERROR "${table_name}:${number}: class ${row_class} is listed twice")
    endif()
    list(APPEND classes ${class_key})
    if(row_symbol IN_LIST symbols)
      message(FATAL_ERROR "${table_name}:${number}: symbol ${row_symbol} is used twice")
    endif()
    list(APPEND symbols ${row_symbol})

    set(lib ${row_library})
    if(NOT lib IN_LIST libraries)
      list(APPEND libraries ${lib})
      set(location_${lib} ${row_location})
      set(providers_${lib} "")
      set(sfcb_${lib} "")
      set(capabilities_${lib} "")
      set(header_rows_${lib} "")
      set(header_providers_${lib} "")
    endif()

    # The header: every class under its symbol; per library, its rows and its distinct providers.
    set(instance false)
    set(association false)
    if("instance" IN_LIST row_kinds)
      set(instance true)
    endif()
    if("association" IN_LIST row_kinds)
      set(association true)
    endif()
    string(APPEND header_classes " \\\n  X(${row_symbol}, \"${row_class}\")")
    string(APPEND header_rows_${lib}
      " \\\n  X(\"${row_class}\", \"${row_provider}\", ${instance}, ${association})")
    if(NOT row_provider IN_LIST providers_${lib})
      string(APPEND header_providers_${lib} " \\\n  X(${row_provider}, \"${row_provider}\")")
    endif()

    # sfcb: one section per class. Providers of one library share a group, so sfcb loads the
    # library into one provider process instead of one per class.
    list(JOIN row_kinds " " sfcb_types)
    list(JOIN row_namespaces " " sfcb_namespaces)
    string(APPEND sfcb_${lib}
      "[${row_class}]\n"
      "   provider: ${row_provider}\n"
      "   location: ${row_location}\n"
      "   type: ${sfcb_types}\n"
      "   namespace: ${sfcb_namespaces}\n"
      "   group: ${row_location}\n"
      "#\n")

    # OpenPegasus: one PG_Provider per provider name, one PG_ProviderCapabilities per class.
    # ProviderType 2 is an instance provider, 3 an association provider.
    if(NOT row_provider IN_LIST providers_${lib})
      list(APPEND providers_${lib} ${row_provider})
    endif()
    set(types "")
    foreach(kind IN LISTS row_kinds)
      if(kind STREQUAL "instance")
        list(APPEND types 2)
      else()
        list(APPEND types 3)
      endif()
    endforeach()
    list(JOIN types ", " pegasus_types)
    _bluelight_mof_string_array(pegasus_namespaces ${row_namespaces})
    string(APPEND capabilities_${lib}
      "instance of PG_ProviderCapabilities\n"
      "{\n"
      "    ProviderModuleName = \"${row_location}\";\n"
      "    ProviderName = \"${row_provider}\";\n"
      "    CapabilityID = \"${row_class}\";\n"
      "    ClassName = \"${row_class}\";\n"
      "    Namespaces = ${pegasus_namespaces};\n"
      "    ProviderType = {${pegasus_types}};\n"
      "    SupportedProperties = NULL;\n"
      "    SupportedMethods = NULL;\n"
      "};\n\n")
  endforeach()
  if(NOT libraries)
    message(FATAL_ERROR "${table_name} lists no provider")
  endif()

  set(sfcb_files "")
  set(pegasus_files "")
  foreach(lib IN LISTS libraries)
    set(location ${location_${lib}})
    set(sfcb_file ${ARG_OUTPUT_DIR}/sfcb/${location}.reg)
    file(CONFIGURE OUTPUT ${sfcb_file} @ONLY CONTENT
"# sfcb provider registration of lib${location}.so.
# Generated by the build from ${table_name}; edit that table, not this file.
# Stage with: sfcbstage -n root/cimv2 -r ${location}.reg <class MOF>, then run sfcbrepos.
#
${sfcb_${lib}}")
    list(APPEND sfcb_files ${sfcb_file})

    set(pegasus_providers "")
    foreach(provider IN LISTS providers_${lib})
      string(APPEND pegasus_providers
        "instance of PG_Provider\n"
        "{\n"
        "    ProviderModuleName = \"${location}\";\n"
        "    Name = \"${provider}\";\n"
        "};\n\n")
    endforeach()
    set(pegasus_file ${ARG_OUTPUT_DIR}/pegasus/${location}-registration.mof)
    string(STRIP "${capabilities_${lib}}" capabilities)
    file(CONFIGURE OUTPUT ${pegasus_file} @ONLY CONTENT
"// OpenPegasus provider registration of lib${location}.so.
// Generated by the build from ${table_name}; edit that table, not this file.
// Load into the interop namespace: cimmof -n root/PG_InterOp ${location}-registration.mof

instance of PG_ProviderModule
{
    Name = \"${location}\";
    Location = \"${location}\";
    Vendor = \"${ARG_VENDOR}\";
    Version = \"${ARG_VERSION}\";
    InterfaceType = \"CMPI\";
    InterfaceVersion = \"2.0.0\";
};

${pegasus_providers}${capabilities}
")
    list(APPEND pegasus_files ${pegasus_file})
  endforeach()

  if(ARG_HEADER)
    set(header_libraries "")
    foreach(lib IN LISTS libraries)
      string(APPEND header_libraries
        "\n// The rows of ${lib}.\n"
        "#define BLUELIGHT_TABLE_ROWS_${lib}(X)${header_rows_${lib}}\n"
        "\n// The providers of ${lib}, each once.\n"
        "#define BLUELIGHT_TABLE_PROVIDERS_${lib}(X)${header_providers_${lib}}\n")
    endforeach()
    file(CONFIGURE OUTPUT ${ARG_HEADER} @ONLY CONTENT
"// The provider table for C++: the class and provider names of the module and of the command-line
// tool come from here, so they are the names the registrations carry.
// Generated by the build from ${table_name}; edit that table, not this file.
//
// Each list calls the macro X it is given once per entry, in the table's order:
//   BLUELIGHT_TABLE_CLASSES(X)            X(symbol, \"class\") for every row; symbol is the
//                                         table's symbol column, the name of the constant that
//                                         holds the class name
//   BLUELIGHT_TABLE_ROWS_<library>(X)     X(\"class\", \"provider\", instance, association) for
//                                         every row of that library; instance and association
//                                         are true when the kinds column names them
//   BLUELIGHT_TABLE_PROVIDERS_<library>(X)  X(provider, \"provider\") for every provider of that
//                                         library, each once; a provider's name is an
//                                         identifier too, as its factory functions show
// <library> is the table's library column.
#ifndef BLUELIGHT_PROVIDERTABLE_H
#define BLUELIGHT_PROVIDERTABLE_H

// Every class of the table.
#define BLUELIGHT_TABLE_CLASSES(X)${header_classes}
${header_libraries}
#endif  // BLUELIGHT_PROVIDERTABLE_H
")
  endif()

  if(ARG_SFCB_FILES)
    set(${ARG_SFCB_FILES} ${sfcb_files} PARENT_SCOPE)
  endif()
  if(ARG_PEGASUS_FILES)
    set(${ARG_PEGASUS_FILES} ${pegasus_files} PARENT_SCOPE)
  endif()
  if(ARG_LIBRARIES)
    set(${ARG_LIBRARIES} ${libraries} PARENT_SCOPE)
  endif()
endfunction()
