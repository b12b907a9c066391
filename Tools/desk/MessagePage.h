// What fills the window while there is no production to show: a word, a bar, and what can be done.
#pragma once

#include <functional>
#include <vector>

#include <QtWidgets/QHBoxLayout>
#include <QtWidgets/QLabel>
#include <QtWidgets/QProgressBar>
#include <QtWidgets/QWidget>

namespace Desk {

class MessagePage : public QWidget {
    Q_OBJECT
public:
    struct Button {
        QString text;
        std::function<void()> action;
    };
    enum class Bar { kNone, kRunning };

    explicit MessagePage(QWidget* inParent = nullptr);

    void Show(const char* inIcon, const QString& inTitle, const QString& inText, Bar inBar,
              const std::vector<Button>& inButtons);

private:
    QLabel* mIcon;
    QLabel* mTitle;
    QLabel* mText;
    QProgressBar* mBar;
    QHBoxLayout* mButtons;
};

}  // namespace Desk
