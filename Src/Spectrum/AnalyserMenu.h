#pragma once

#include <span>

#include "Platform/Export.h"

namespace Corvo {

// The analyser's pop-up menu, for hosts that do not write their own.
//
// A host makes a submenu for each group, in the table's order, with the group's name for its title and the
// entries' texts in it. Before showing it, it puts a tick before every entry for which
// kivspectrum::popupmenu_checked(command) is true; when one is chosen, it passes the command to
// popupmenu_process. Any thread; the table is constant, and its texts live as long as the library is loaded.
struct AnalyserMenuEntry {
    int command;        // 1200..1402, each once
    const char* group;  // plain ASCII, English; entries of a group stand together
    const char* text;   // the entry's, in the same English

    // How the library carries it out; not for hosts.
    struct Action;
    const Action* action;
    int value;
};

// Every entry, in the order of the menu.
DSP_API std::span<const AnalyserMenuEntry> AnalyserMenu();
// Null when the command is none of the table's.
DSP_API const AnalyserMenuEntry* FindAnalyserMenuEntry(int command);

}  // namespace Corvo
