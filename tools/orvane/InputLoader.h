#pragma once
// Reads the command's INPUT, tells its kind from its content and gives the frame
// recording the filter would be given for it.

#include <string>
#include <vector>

#include "tools/evemu/EvemuConversion.h"
#include "tools/files/OutputCheck.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::cli {

// "-" reads standard input (named "<stdin>" in messages). On failure `error` is one line
// naming the file (and the line where there is one).
bool loadFrameInput(const std::string& path, formats::FrameRecording* recording, std::string* error);

// The same, with the options of an evemu recording (refused for any other kind of input);
// `isEvemu` says whether INPUT was one.
bool loadFrameInput(const std::string& path, const evemu::EvemuOptions& evemuOptions,
                    formats::FrameRecording* recording, std::string* error, bool* isEvemu = nullptr);

// The files that reading INPUT may open (INPUT itself, the evemu description given with
// --desc or lying beside it), as the command line names them, for comparing with the
// outputs before anything is read. `role` names INPUT in messages.
std::vector<files::NamedPath> inputFiles(const std::string& path, const evemu::EvemuOptions& evemuOptions,
                                         const std::string& role = "INPUT");

}  // namespace orvane::cli
