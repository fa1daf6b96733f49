#include "FramesCommand.h"

#include <iostream>

#include "InputLoader.h"
#include "OutputFile.h"

namespace orvane::cli {

int runFrames(const FramesOptions& options) {
    std::string error;
    formats::FrameRecording recording;
    if (!loadFrameInput(options.input, options.evemu, &recording, &error)) {
        std::cerr << error << '\n';
        return 1;
    }
    OutputFile out;
    if (!out.open(options.out, &error)) {
        std::cerr << error << '\n';
        return 1;
    }
    formats::writeFrameRecording(out.stream(), recording);
    if (!out.commit(&error)) {
        std::cerr << error << '\n';
        return 1;
    }
    return 0;
}

}  // namespace orvane::cli
