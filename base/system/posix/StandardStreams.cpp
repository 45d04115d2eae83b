// The numbers of the standard streams.

#include "base/system/StandardStreams.h"

#include <fcntl.h>

namespace base {

const char* const kStandardInputName = "/dev/stdin";

void OccupyStandardStreams() {
    for (const int stream : {kStandardInput, kStandardOutput, kStandardError})
        // The lowest free number is taken, which is this one.
        if (fcntl(stream, F_GETFD) < 0)
            open("/dev/null", stream == kStandardInput ? O_WRONLY : O_RDONLY);
}

Descriptor Duplicate(int standardStream) {
    return Descriptor(fcntl(standardStream, F_DUPFD_CLOEXEC, kStandardError + 1));
}

}  // namespace base
