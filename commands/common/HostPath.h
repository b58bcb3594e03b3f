// Where the plug-in finds the host's own files and scripts.
//
// This is the one place that reads MESK_HOST_ROOT: a test or a simulated host sets it to a
// directory that stands for the host's root, and every command reaches host files through
// these functions instead of reading the environment itself.
#pragma once

#include <string>

namespace OrvaneCli {
namespace MeskNamespace {

// The path of a host file given by its absolute path: below the directory that MESK_HOST_ROOT
// names when that variable is set and not empty, else the path itself.
std::string HostPath(const std::string& absolutePath);

// The same path as one word of a `sh -c` command line, for an absolute path that is the
// plug-in's own fixed text. The root in front of it may hold any character, blanks, quotes and
// line breaks included: it is single-quoted, so the shell takes it literally. Without a root
// the path comes back unchanged.
std::string HostShellPath(const std::string& absolutePath);

// `text` as one single-quoted shell word that the shell takes literally: every single quote
// inside it becomes '\''.
std::string ShellQuote(const std::string& text);

}  // namespace MeskNamespace
}  // namespace OrvaneCli
