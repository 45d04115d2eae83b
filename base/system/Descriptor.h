// An open file that is closed when its owner goes.

#pragma once

#include <utility>

namespace base {

class Descriptor {
  public:
    explicit Descriptor(int number = -1) : number_(number) {}
    Descriptor(Descriptor&& other) noexcept : number_(std::exchange(other.number_, -1)) {}
    Descriptor& operator=(Descriptor&& other) noexcept {
        std::swap(number_, other.number_);
        return *this;
    }
    ~Descriptor() { Close(); }

    bool IsOpen() const { return number_ >= 0; }
    int Get() const { return number_; }

    /// False, with errno, when what was written before could not be kept.
    bool Close();

  private:
    int number_;
};

}  // namespace base
