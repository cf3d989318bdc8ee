#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"

#include <exception>
#include <new>

int main(int count, char** arguments) {
    try {
        routeLibraryLog();
        return runCommandLine(allCommands(), count, arguments);
    } catch (const std::bad_alloc&) {
        reportError("not enough memory");
    } catch (const std::exception& error) {
        reportError(String("unexpected failure: ") + error.what());
    }
    return kFailed;
}
