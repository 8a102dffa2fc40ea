#include "commands.h"
#include "show/hostdot.h"
#include "show/hostjson.h"
#include "show/hosttree.h"
#include "show/readhost.h"

namespace vornovsctl {

Answer Show(const Context& context)
{
    const HostModel host = ReadHost();
    Answer answer;
    if (context.arguments.format == "dot") {
        answer.text = DotOf(host);
    } else if (context.arguments.IsJson()) {
        answer.fields = FieldsOf(host);
    } else {
        answer.text = DrawTree(TreeOf(host), context.terminal);
    }

    for (const std::string& fault : host.unread) {
        answer.error += (answer.error.empty() ? "" : "\n") + fault + '.';
    }
    answer.exitStatus = answer.error.empty() ? kHolds : kDoesNotHold;
    return answer;
}

} // namespace vornovsctl
