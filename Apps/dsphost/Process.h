#pragma once

#include <cstdio>
#include <filesystem>
#include <string>
#include <vector>

namespace dsphost {

// The program among others: its arguments, its messages, and the signals that end it.

// Call first. Standard input and output are bytes from now on; an interrupt, a hang-up or the console's end
// removes what is unfinished and ends the program with status 130.
void PrepareProcess();
// The arguments of `main` in UTF-8.
std::vector<std::string> Utf8Arguments(int count, char** arguments);

// While one of these lives, a signal waits; it ends the program afterwards.
class SignalsWait {
public:
    SignalsWait();
    SignalsWait(const SignalsWait&) = delete;
    SignalsWait& operator=(const SignalsWait&) = delete;
    ~SignalsWait();

    // From now on a signal removes this file, until it is finished or gone.
    void BeginFile(const std::filesystem::path& path);
    void EndFile(const std::filesystem::path& path);
};

// True where a person would see what is written there.
bool IsTerminal(std::FILE* stream);
// Writes to standard output; throws IoError.
void Print(const std::string& text);
// Renews the last line of standard error; messages clear it first.
void ShowProgress(const std::string& line);
void ClearProgress();
// One line on standard error, headed by the program's name. What cannot be printed, a file's name may hold
// it, is escaped.
void PrintMessage(const std::string& text);

}  // namespace dsphost
