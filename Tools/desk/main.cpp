// zo-desk: a small desktop host, for those who work on a production and for those who write a host.
#include <cstdio>

#include <QtCore/QCommandLineParser>
#include <QtCore/QLocale>
#include <QtWidgets/QApplication>

#include "Host.h"
#include "Icons.h"
#include "ostcore/config/ZString.h"
#include "ZOClient/Library.h"

namespace {

/// What the desktop has given the application before it gets a look of its own.
ZOClientQt::ColorScheme GetDesktopScheme() {
    const bool isDark = QApplication::palette().color(QPalette::Window).lightness() < 128;
    return isDark ? ZOClientQt::ColorScheme::kDark : ZOClientQt::ColorScheme::kLight;
}

void UseLanguage(const QLocale& inLocale) {
    const std::string language = inLocale.name().toStdString();
    if (ZOCL::LoadShippedLanguage(language)) {
        ostcore::config::Localizer::SetLanguage(language);
    }
}

Desk::StartOptions ReadOptions(const QApplication& inApplication) {
    QCommandLineParser parser;
    parser.setApplicationDescription(
        QStringLiteral("Work on a production in windows. 'zo desk' starts this program "
                       "with the login of zo."));
    const QCommandLineOption server(QStringLiteral("server"),
                                    QStringLiteral("The hub: a URL, or a host name."), QStringLiteral("URL"));
    const QCommandLineOption user(QStringLiteral("user"), QStringLiteral("The user name at the hub."),
                                  QStringLiteral("NAME"));
    const QCommandLineOption plain(QStringLiteral("plain"),
                                   QStringLiteral("A hub named without a scheme is reached without TLS."));
    parser.addOptions({server, user, plain});
    parser.addHelpOption();
    parser.addVersionOption();
    parser.addPositionalArgument(QStringLiteral("PRODUCTION"), QStringLiteral("By name or identifier."),
                                 QStringLiteral("[PRODUCTION]"));
    parser.process(inApplication);
    Desk::StartOptions options;
    options.login.server = parser.value(server);
    options.login.user = parser.value(user);
    options.login.isSecure =
        !parser.isSet(plain) && !options.login.server.startsWith(QLatin1String("http://"));
    options.production = parser.positionalArguments().value(0);
    return options;
}

}  // namespace

int main(int inCount, char** inArguments) {
    QApplication application(inCount, inArguments);
    QApplication::setApplicationName(QStringLiteral("zo-desk"));
    QApplication::setApplicationVersion(QStringLiteral(DESK_VERSION));
    const Desk::StartOptions options = ReadOptions(application);
    ZOClientQt::UseModernStyle(GetDesktopScheme());
    UseLanguage(QLocale());
    const Desk::Host host(options);
    QApplication::setWindowIcon(Desk::GetIcon("SP_MeridaneLogo_44x42"));
    return QApplication::exec();
}
