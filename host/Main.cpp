// corvane-flash: programs the flash of Corvane microcontrollers through the flash plug-in.

#include "host/Interrupt.h"
#include "host/Tool.h"

int main(int argc, char** argv) {
    host::CatchInterrupts();
    return host::RunTool({argv + 1, argv + argc});
}
