// zxusage.h - command-line options and the usage screen.
//
// A program declares its options as one short text and calls init_opts()
// once at the top of zx_main():
//
//   init_opts("-?; -r9q :s");
//   if (opt_on("-?")) show_usage("");
//   zxStr directory = g_opts.get("-r9q");
//
// Entries of the text are separated by commas or semicolons, their words by
// white space.  The first word is the option's name, dash included; a word
// with ":s" in it says that the option takes a parameter that is not empty,
// one with ":b", or none, that it is a flag ("-x", "-x+", "-x-"); any other
// word is a further spelling.
#ifndef ZXUSAGE_H
#define ZXUSAGE_H

#include "zxaa.h"
#include "zxqva.h"
#include "zxstr.h"

// The options given: name to parameter, which is empty for a plain flag.
// Emptied by an exit handler that init_opts() registers.
extern zxSA<zxStr> g_opts;

// Parses g_args by the declaration into g_opts.  Returns only if the command
// line was good; otherwise the usage screen ends the process.
void init_opts(zxStr declaration);

// The parse itself: takes leading options off the front of `args` into
// `opts`, where a repeated option replaces the earlier.  Empty on success; a
// blank if an undeclared "-?" stopped it; else what is wrong.
zxStr parse_opts(const zxStr& declaration, zxQVA<zxStr>& args,
                 zxSA<zxStr>& opts);

// True if the option was given, and not with the parameter "-".
bool opt_on(const zxStr& option);

// Writes the usage screen to standard error, with "Error: " and the message
// ahead of it unless that is empty or a blank, and ends the process with
// exit code 1 through its exit handlers.
void show_usage(const zxStr& message);

#endif  // ZXUSAGE_H
