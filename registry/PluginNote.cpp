// The plug-in's name and version, for `autocli --version`: an ELF note (owner "AutoCli",
// type 1, the text "NAME VERSION") that the loader maps with the library, so that the
// framework reads it without the plug-in exporting anything beyond its entry point.
#ifndef MESK_VERSION
#error "MESK_VERSION must name the plug-in's version"
#endif

// clang-format off
asm(".pushsection .note.autocli.plugin, \"a\", @note\n"
    ".balign 4\n"
    ".long 2f - 1f\n"              // owner size
    ".long 4f - 3f\n"              // text size
    ".long 1\n"                    // type: name and version
    "1: .asciz \"AutoCli\"\n"
    "2: .balign 4\n"
    "3: .asciz \"mesk " MESK_VERSION "\"\n"
    "4: .balign 4\n"
    ".popsection\n");
// clang-format on
