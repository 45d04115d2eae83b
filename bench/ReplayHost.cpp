#include "bench/ReplayHost.h"

namespace bench {

const char* ReplayHost::Note(const test::Call& call) {
    if (recording) {
        calls_.push_back(call);
        if (call.text != nullptr) calls_.back().text = texts_.insert(call.text).first->c_str();
    }
    return LeanHost::Note(call);
}

void ReplayHost::Replay() {
    for (const test::Call& call : calls_)
        Make(call);
}

// The slots, as the interface numbers them.
void ReplayHost::Make(const test::Call& call) {
    switch (call.slot) {
        case 0:
            GetProperty(call.text);
            break;
        case 1:
            SetProperty(call.text, "");
            break;
        case 2:
            LoadProgram(call.text, "", "/");
            break;
        case 4:
            RunTarget();
            break;
        case 6:
            HaltTarget();
            break;
        case 7:
            ResetTarget(call.number != 0);
            break;
        case 10:
            ReadMemory(buffer_.data(), call.count, call.address, call.page, call.width);
            break;
        case 11:
            WriteMemory(buffer_.data(), call.count, call.address, call.page, call.width);
            break;
        case 16:
            BeginProgress(call.text);
            break;
        case 17:
            UpdateProgress(call.number, call.text);
            break;
        case 18:
            EndProgress();
            break;
        case 20:
            ShowMessage(call.text);
            break;
        case 22:
            Sleep(call.number);
            break;
    }
}

}  // namespace bench
