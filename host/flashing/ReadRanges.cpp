// The phase begins with its total known and ends when all is read.

#include "host/flashing/ReadRanges.h"

namespace host {

image::Image ReadRanges(FlashReader& reader, WorkMeter& meter, Phase phase,
                        const base::AddressSet& ranges) {
    meter.Expect(phase, ranges.Bytes());
    meter.Begin(phase);
    image::Image contents;
    for (const base::AddressRange& range : ranges.Ranges())
        contents.Add(range.first, reader.ReadFlash(range), "the flash");
    meter.End();
    return contents;
}

}  // namespace host
