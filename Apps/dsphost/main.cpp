#include <exception>
#include <new>
#include <string>
#include <vector>

#include "CommandLine.h"
#include "Errors.h"
#include "Process.h"

namespace {

constexpr int kSuccess = 0, kIoFailure = 1, kUserFailure = 2;

int Run(std::vector<std::string> arguments) {
    using namespace dsphost;
    try {
        std::vector<char*> pointers;
        for (auto& argument : arguments) pointers.push_back(argument.data());
        RunCommandLine(static_cast<int>(pointers.size()), pointers.data());
        return kSuccess;
    } catch (const UserError& error) {
        PrintMessage(error.what());
        return kUserFailure;
    } catch (const std::bad_alloc&) {
        PrintMessage("out of memory");
        return kIoFailure;
    } catch (const std::exception& error) {
        PrintMessage(error.what());
        return kIoFailure;
    }
}

}  // namespace

int main(int count, char** arguments) {
    dsphost::PrepareProcess();
    return Run(dsphost::Utf8Arguments(count, arguments));
}
