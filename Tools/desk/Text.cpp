// Looks texts up by their keys.
#include "Text.h"

#include "ostcore/config/ZString.h"
#include "ZOClient/ResultCodes.h"

namespace Desk {

QString Text(const char* inKeyAndText, const QStringList& inArguments) {
    std::vector<ostcore::U8String> arguments;
    for (const QString& argument : inArguments) {
        arguments.push_back(argument.toStdString());
    }
    return QString::fromStdString(ostcore::ZString(inKeyAndText, arguments).AsUTF8());
}

QString DescribeResult(int inResult) {
    switch (inResult) {
        case ZOCL::kResultNoHTTPResponse:
        case ZOCL::kResultRequestCancelled:
            return Text("$$$/ZODesk/Result/NoResponse=The server did not answer.");
        case ZOCL::kResultHTTPForbidden:
            return Text("$$$/ZODesk/Result/Forbidden=You do not have the right to do this.");
        case ZOCL::kResultHTTPNotFound:
            return Text("$$$/ZODesk/Result/NotFound=It is not there any more.");
        case ZOCL::kResultHTTPPreconditionFailed:
            return Text("$$$/ZODesk/Result/Moved=Your session was changed from elsewhere. Please try again.");
        default:
            return Text("$$$/ZODesk/Result/Other=It did not work (@0).",
                        {QString::fromUtf8(ZOCL::GetResultMeaning(inResult))});
    }
}

QString ToTip(const QString& inText) {
    return QStringLiteral("<p style='white-space: pre-wrap'>") + inText.toHtmlEscaped() +
           QStringLiteral("</p>");
}

}  // namespace Desk
