// corvane-flash: programs the flash of Corvane microcontrollers through the flash plug-in.

#include "base/system/Environment.h"
#include "base/system/Signals.h"
#include "base/system/StandardStreams.h"
#include "host/Tool.h"

int main(int argc, char** argv) {
    base::OccupyStandardStreams();
    base::CatchSignals();
    return host::RunTool(base::ArgumentWords(argc, argv));
}
