#pragma once

namespace dsphost {

// Reads the command line and runs the command it names, or prints the help asked for. Throws what the command
// throws, and UserError for a command line that cannot be read.
void RunCommandLine(int count, char** arguments);

}  // namespace dsphost
