#include <exception>

#include "CommandLine.h"
#include "Errors.h"
#include "File.h"

namespace {

constexpr int kSuccess = 0, kIoFailure = 1, kUserFailure = 2, kInterrupted = 130;

int Run(int count, char** arguments) {
    using namespace dsphost;
    try {
        RunCommandLine(count, arguments);
        return kSuccess;
    } catch (const UserError& error) {
        PrintMessage(error.what());
        return kUserFailure;
    } catch (const Interrupted& error) {
        PrintMessage(error.what());
        return kInterrupted;
    } catch (const std::exception& error) {
        PrintMessage(error.what());
        return kIoFailure;
    }
}

}  // namespace

int main(int count, char** arguments) {
    dsphost::PrepareProcess();
    return Run(count, arguments);
}
