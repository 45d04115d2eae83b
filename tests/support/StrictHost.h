// What every host of the tests does with the slots that keep their places: a call of one ends the
// process, whoever made it.

#pragma once

#include <cstdio>
#include <cstdlib>

#include "plugin/IFlashHost.h"

namespace test {

class StrictHost : public IFlashHost {
  public:
    const char* Reserved3() final { return Refuse(3); }
    const char* Reserved5() final { return Refuse(5); }
    const char* Reserved8() final { return Refuse(8); }
    const char* Reserved9() final { return Refuse(9); }
    const char* Reserved12() final { return Refuse(12); }
    const char* Reserved13() final { return Refuse(13); }
    const char* Reserved14() final { return Refuse(14); }
    const char* Reserved15() final { return Refuse(15); }

  protected:
    ~StrictHost() = default;

  private:
    [[noreturn]] static const char* Refuse(int slot) {
        std::fprintf(stderr, "the reserved slot %d was called\n", slot);
        std::abort();
    }
};

}  // namespace test
