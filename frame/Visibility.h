// Symbol visibility of the platform's interfaces.
//
// The plug-in is compiled with hidden visibility; the framework's and the host-control
// library's classes keep default visibility so that their type information is shared
// across library boundaries (dynamic casts between objects made by different libraries).
#pragma once

#define KALMOR_API __attribute__((visibility("default")))
#define HOSTCTL_API __attribute__((visibility("default")))
