// Symbol visibility of the platform's interfaces.
//
// The plug-in is compiled with hidden visibility; the framework's and the host-control
// library's classes keep default visibility so that their type information is shared
// across library boundaries (dynamic casts between objects made by different libraries).
#pragma once

#define KALMOR_API __attribute__((visibility("default")))
#define HOSTCTL_API __attribute__((visibility("default")))

// Marks a plug-in's entry point: C linkage, and exported although the plug-in's other symbols
// are hidden. Every plug-in defines it as `AUTOCLI_PLUGIN_ENTRY void AutoCli_RegisterNamespaces(
// std::shared_ptr<Kalmor::AutoCli::NamespaceNode>* root)`.
#define AUTOCLI_PLUGIN_ENTRY extern "C" __attribute__((visibility("default")))
