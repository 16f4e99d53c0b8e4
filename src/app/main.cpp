// orv_cmd: finds the logger sessions under the given paths and writes their results.
#include "app/run_state.h"
#include "platform/console.h"
#include "platform/system_info.h"

int main(int argc, char** argv) {
    platform::Console console;
    orv::RunEnvironment environment;
    environment.vectorStartupStatus = platform::vectorKernelStartup();
    return orv::runOrvCmd(argc, argv, console, environment);
}
