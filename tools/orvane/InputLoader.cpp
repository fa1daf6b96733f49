#include "InputLoader.h"

#include <iostream>
#include <iterator>

#include "tools/formats/InputKind.h"
#include "tools/script/GestureScriptFrames.h"

namespace orvane::cli {

bool loadFrameInput(const std::string& path, formats::FrameRecording* recording, std::string* error) {
    std::string content;
    std::string name = path;
    if (path == "-") {
        name = "<stdin>";
        content.assign(std::istreambuf_iterator<char>(std::cin), std::istreambuf_iterator<char>());
        if (std::cin.bad()) {
            *error = name + ": cannot be read";
            return false;
        }
    } else if (!formats::readFileContent(path, &content, error)) {
        return false;
    }
    if (script::isGestureScript(content)) return script::readGestureScript(content, name, recording, error);
    const formats::InputKindResult kind = formats::detectInputKind(content);
    switch (kind.kind) {
    case formats::InputKind::FrameRecording: return formats::readFrameRecording(content, name, recording, error);
    case formats::InputKind::Evemu: *error = name + ": evemu recordings are not supported yet"; return false;
    case formats::InputKind::Unknown:
        *error = name + ":" + std::to_string(kind.line) + ": not a frame recording";
        return false;
    }
    return false;
}

}  // namespace orvane::cli
