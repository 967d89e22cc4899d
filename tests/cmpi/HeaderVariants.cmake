# Makes variants of the project's CMPI headers, each with a way in which those of object managers differ.
#
# cmake -D SOURCE=FOLDER -D OUTPUT=FOLDER -P HeaderVariants.cmake: reads the headers in SOURCE and writes a folder for each
# variant into OUTPUT.
cmake_minimum_required(VERSION 3.25)

set(headers cmpidt.h cmpift.h cmpimacs.h cmpios.h cmpipl.h)

# Reads the headers into variables of their names.
macro(read_headers)
  foreach(header IN LISTS headers)
    file(READ "${SOURCE}/${header}" ${header})
  endforeach()
endmacro()

# Replaces every match in a header; a header that has none is not the one that the variant was made for.
function(replace header expression replacement)
  string(REGEX REPLACE "${expression}" "${replacement}" text "${${header}}")
  if(text STREQUAL "${${header}}")
    message(FATAL_ERROR "${SOURCE}/${header} has nothing that matches ${expression}")
  endif()
  set(${header} "${text}" PARENT_SCOPE)
endfunction()

macro(write_headers variant)
  foreach(header IN LISTS headers)
    file(WRITE "${OUTPUT}/${variant}/${header}" "${${header}}")
  endforeach()
endmacro()

# Handles that are changed are not const; what is not known of the platform and the version is an error; the services that
# came late into version 2.0 are missing; a word of Windows' compilers says how a thread's function is called.
read_headers()
foreach(slot setNameSpace setHostname setClassName addKey setNameSpaceFromObjectPath setHostAndNameSpaceFromObjectPath)
  replace(cmpift.h "\\(\\*${slot}\\)\\(const CMPIObjectPath\\*" "(*${slot})(CMPIObjectPath*")
endforeach()
foreach(slot setPropertyFilter setObjectPath)
  replace(cmpift.h "\\(\\*${slot}\\)\\(const CMPIInstance\\*" "(*${slot})(CMPIInstance*")
endforeach()
replace(cmpift.h "\\(\\*setElementAt\\)\\(const CMPIArray\\*" "(*setElementAt)(CMPIArray*")
replace(cmpift.h "\\(\\*newThread\\)\\(CMPIThreadFunc," "(*newThread)(CMPI_THREAD_RETURN (__cdecl* start)(void*),")
replace(cmpift.h "[^;]*\\(\\*authorizeFilterCollection\\)[^}]*\\(\\*deActivateFilterCollection\\)[^;]*;" "")
replace(cmpift.h "[^;]*\\(\\*setPropertyWithOrigin\\)\\(CMPIPropertyMI[^;]*;" "")
string(APPEND cmpipl.h "
#if !defined CMPI_PLATFORM_LINUX_GENERIC_GNU || CMPI_VERSION != 200
#error the platform and the version are not defined
#endif
")
write_headers(handles-not-const)

# What this interface calls macros are functions, which take values of one type only and do not look into objects.
read_headers()
set(functions)
foreach(function
    "CMAddKey|const CMPIObjectPath|addKey|const char* name, |name, "
    "CMAddArg|const CMPIArgs|addArg|const char* name, |name, "
    "CMSetProperty|const CMPIInstance|setProperty|const char* name, |name, "
    "CMSetArrayElementAt|const CMPIArray|setElementAt|CMPICount index, |index, "
    "CMReturnData|const CMPIResult|returnData||")
  string(REPLACE "|" ";" parts "${function}")
  list(GET parts 0 name)
  list(GET parts 1 type)
  list(GET parts 2 slot)
  list(GET parts 3 parameter)
  list(GET parts 4 argument)
  string(APPEND functions "#undef ${name}
static inline CMPIStatus ${name}(${type}* object, ${parameter}const CMPIValue* value, CMPIType type) {
    return object->ft->${slot}(object, ${argument}value, type);
}
")
endforeach()
string(APPEND functions "#undef CMIsNullObject
static inline CMPIBoolean CMIsNullObject(const void* object) { return object == NULL; }
#undef CMGetCharsPtr
static inline const char* CMGetCharsPtr(const CMPIString* string, CMPIStatus* rc) {
    return string->ft->getCharPtr(string, rc);
}
")
replace(cmpimacs.h "\n#endif\n$" "\n${functions}\n#endif\n")
write_headers(functions-for-macros)

# The tables of a later object manager have slots behind the known ones, and its headers describe the version that they
# are asked for.
read_headers()
replace(cmpidt.h "#define CMPICurrentVersion CMPIVersion200" "#define CMPICurrentVersion CMPI_VERSION")
replace(cmpift.h "(struct _CMPI[A-Za-z]*FT {\n    (CMPIVersion ftVersion|unsigned int brokerCapabilities);[^}]*)}"
  "\\1    void (*laterSlots[4])(void);\n}")
foreach(kind Instance Association Method Property Indication)
  # What a provider for version 2.0 defines has that version's slots only.
  replace(cmpift.h "(struct _CMPI${kind}MIFT {[^}]*)    void \\(\\*laterSlots\\[4\\]\\)\\(void\\);\n}" "\\1}")
endforeach()
write_headers(later-tables)
