// The C library's numbers of the standard streams. A program without a console may have none.

#include "base/system/StandardStreams.h"

#include <fcntl.h>
#include <io.h>

#include "base/system/windows/Text.h"

namespace base {

const char* const kStandardInputName = "-";

void OccupyStandardStreams() {
    for (const int stream : {kStandardInput, kStandardOutput, kStandardError}) {
        // The lowest free number is taken, which is this one.
        if (_get_osfhandle(stream) == -1 || _get_osfhandle(stream) == -2)
            _wopen(L"NUL", (stream == kStandardInput ? _O_WRONLY : _O_RDONLY) | _O_BINARY);
        else
            _setmode(stream, _O_BINARY);
    }
}

Descriptor Duplicate(int standardStream) {
    return Descriptor(_dup(standardStream));
}

}  // namespace base
