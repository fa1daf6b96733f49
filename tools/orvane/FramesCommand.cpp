#include "FramesCommand.h"

#include <iostream>

#include "InputLoader.h"
#include "tools/files/OutputCheck.h"
#include "tools/files/OutputFile.h"
#include "tools/files/TemporaryFiles.h"

namespace orvane::cli {

int runFrames(const FramesOptions& options) {
    std::string error;
    if (!files::checkOutputs(inputFiles(options.input, options.evemu), {{"--out", options.out}}, &error)) {
        std::cerr << error << '\n';
        return 2;
    }
    files::TemporaryFiles::removeOnSignals();
    formats::FrameRecording recording;
    if (!loadFrameInput(options.input, options.evemu, &recording, &error)) {
        std::cerr << error << '\n';
        return 1;
    }
    files::OutputFile out;
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
