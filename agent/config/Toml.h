/**
 * The library that parses TOML, toml++, told to leave the process alone where memory is short. What it throws as an
 * error of the text it makes in functions that must not throw, which ends the process where there is no memory for it:
 * so errors are returned. Numbers it reads from streams, which take a lack of memory for a wrong number: so the C++
 * library's own conversion is used, which needs none. Every file includes the library through this one.
 *
 * A source path that is not empty is allocated in a function that must not throw, too: none is given.
 */
#ifndef AGENT_TOML_H
#define AGENT_TOML_H

#define TOML_EXCEPTIONS 0
#define TOML_FLOAT_CHARCONV 1

#include <toml++/toml.h>

#endif
