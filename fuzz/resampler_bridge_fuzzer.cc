// The resampler bridge's checks, driven as a hostile Java caller would: a
// fuzzed format, context bytes rewritten between calls and fuzzed block
// arguments. Every buffer is allocated to exactly the size the bridge is
// told, so AddressSanitizer catches any access the checks let through.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>

#include "fuzz/fuzz_reader.h"
#include "jni/resampler_bridge.h"

namespace {

// Exactly `size` bytes of heap, so that one byte more is a report; never
// null, as a Java array's elements are not.
std::unique_ptr<uint8_t[]> Exact(size_t size) {
  return std::unique_ptr<uint8_t[]>(new uint8_t[size]());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  using resampler_bridge::kContextSize;
  FuzzReader in(data, size);
  const int32_t channels = static_cast<int32_t>(in.Next(1) % 5) - 1;
  const bool stereo = in.Next(1) % 2;
  const int32_t rate = static_cast<int32_t>(in.Next(4));
  // Java may slice the context buffer at any offset.
  const size_t misalign = in.Next(1) % 8;
  std::unique_ptr<uint8_t[]> buffer = Exact(misalign + kContextSize);
  uint8_t* context = buffer.get() + misalign;
  resampler_bridge::Create(context, kContextSize, 2, channels, rate, stereo);
  uint8_t pristine[kContextSize];
  std::memcpy(pristine, context, kContextSize);

  for (int step = 0; step < 32 && !in.empty(); ++step) {
    switch (in.Next(1) % 5) {
      case 0:  // the pointer stays: only what the bridge can check is rewritten
        context[8 + in.Next(1) % 8] = static_cast<uint8_t>(in.Next(1));
        break;
      case 1:
        std::memcpy(context, pristine, kContextSize);
        break;
      case 2:
        if (auto* resampler = resampler_bridge::InstanceOf(context, kContextSize)) {
          resampler->setSourceSampleRate(static_cast<int32_t>(in.Next(4)));
        }
        break;
      case 3:
        if (auto* resampler = resampler_bridge::InstanceOf(context, kContextSize)) {
          resampler->setVolume(static_cast<float>(in.Next(1)) / 64, 1.0f);
        }
        break;
      default: {
        const size_t input_bytes = in.Next(2) % 8192;
        resampler_bridge::Block block{static_cast<int64_t>(input_bytes),
                                      static_cast<int32_t>(in.Next(4)),
                                      static_cast<int32_t>(in.Next(4)),
                                      static_cast<int64_t>(in.Next(2)),
                                      static_cast<int32_t>(in.Next(4)),
                                      in.Next(1) % 2 == 1};
        auto* resampler = resampler_bridge::InstanceOf(context, kContextSize);
        resampler_bridge::ResamplePlan plan;
        if (resampler == nullptr || !resampler_bridge::Plan(*resampler, block, &plan)) break;
        std::unique_ptr<uint8_t[]> input = Exact(input_bytes);
        for (size_t i = 0; i < input_bytes; ++i) input[i] = static_cast<uint8_t>(in.Next(1));
        std::unique_ptr<uint8_t[]> output = Exact(static_cast<size_t>(block.outputBytes));
        resampler_bridge::Run(resampler, plan, input.get(), block.inputOffset, output.get());
      }
    }
  }
  std::memcpy(context, pristine, kContextSize);
  resampler_bridge::Release(context, kContextSize);
  if (resampler_bridge::InstanceOf(context, kContextSize) != nullptr) abort();
  return 0;
}
