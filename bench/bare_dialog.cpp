// The yardstick of windows: the least program that shows a dialog of this kind.

#include <QApplication>
#include <QComboBox>
#include <QDialog>
#include <QLabel>
#include <QPushButton>
#include <QVBoxLayout>

int main(int argc, char* argv[]) {
    QApplication application(argc, argv);
    QDialog dialog;
    auto* layout = new QVBoxLayout(&dialog);
    layout->addWidget(new QLabel("Pair this card with your account?"));
    auto* choice = new QComboBox;
    choice->addItem("Alice");
    layout->addWidget(choice);
    layout->addWidget(new QPushButton("Pair"));
    layout->addWidget(new QPushButton("Cancel"));
    dialog.resize(560, 220);
    dialog.show();
    return QApplication::exec();
}
