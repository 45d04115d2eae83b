// corvane-flash: programs the flash of Corvane microcontrollers through the flash plug-in.

#include "host/Tool.h"
#include "host/base/Interrupt.h"
#include "host/files/Streams.h"

int main(int argc, char** argv) {
    host::OccupyStandardStreams();
    host::CatchSignals();
    return host::RunTool({argv + 1, argv + argc});
}
