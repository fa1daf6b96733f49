#include "InputLoader.h"

#include <unistd.h>

#include <iostream>
#include <iterator>

#include "tools/formats/InputKind.h"
#include "tools/script/GestureScriptFrames.h"

namespace orvane::cli {

bool loadFrameInput(const std::string& path, formats::FrameRecording* recording, std::string* error) {
    return loadFrameInput(path, evemu::EvemuOptions{}, recording, error);
}

std::vector<files::NamedPath> inputFiles(const std::string& path, const evemu::EvemuOptions& evemuOptions,
                                         const std::string& role) {
    std::vector<files::NamedPath> inputs{{role, path}};
    if (!evemuOptions.descriptionPath.empty()) inputs.push_back({"--desc", evemuOptions.descriptionPath});
    if (path != "-")
        for (const std::string& sibling : evemu::siblingDescriptionPaths(path))
            if (::access(sibling.c_str(), F_OK) == 0) inputs.push_back({"the description", sibling});
    return inputs;
}

bool loadFrameInput(const std::string& path, const evemu::EvemuOptions& evemuOptions,
                    formats::FrameRecording* recording, std::string* error, bool* isEvemu) {
    if (isEvemu) *isEvemu = false;
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
    const formats::InputKindResult kind = formats::detectInputKind(content);
    if (evemuOptions.any() && kind.kind != formats::InputKind::Evemu) {
        *error = "orvane: --desc, --size, --keyboard-cover, --tap-to-click and --secondary-click are for evemu "
                 "recordings, and " + name + " is not one";
        return false;
    }
    if (script::isGestureScript(content)) return script::readGestureScript(content, name, recording, error);
    switch (kind.kind) {
    case formats::InputKind::FrameRecording: return formats::readFrameRecording(content, name, recording, error);
    case formats::InputKind::Evemu:
        if (isEvemu) *isEvemu = true;
        return evemu::convertEvemuRecording(content, path, name, evemuOptions, recording, error);
    case formats::InputKind::Unknown:
        *error = name + ":" + std::to_string(kind.line) + ": not a frame recording";
        return false;
    }
    return false;
}

}  // namespace orvane::cli
