#include "answer.h"

#include <algorithm>
#include <ostream>

namespace vornovsctl {

Answer Done(std::string text, Json fields)
{
    return {kHolds, std::move(text), "", std::move(fields)};
}

Answer Failed(int exitStatus, std::string error, Json fields)
{
    return {exitStatus, "", std::move(error), std::move(fields)};
}

void PrintText(const Answer& answer, std::ostream& output, std::ostream& errors)
{
    output << answer.text << std::flush;
    if (!answer.error.empty()) {
        errors << "vornovsctl: " << answer.error << '\n';
    }
}

void PrintJson(const std::string& command, const Answer& answer, std::ostream& output)
{
    Json object;
    object["command"] = command.empty() ? Json(nullptr) : Json(command);
    object["exitStatus"] = answer.exitStatus;
    object.update(answer.fields);
    object["error"] = nullptr;
    if (!answer.error.empty()) {
        std::string line = answer.error;
        std::replace(line.begin(), line.end(), '\n', ' ');
        object["error"] = line;
    }
    // Names may hold any bytes.
    output << object.dump(2, ' ', false, Json::error_handler_t::replace) << std::endl;
}

} // namespace vornovsctl
