#pragma once
// Dialog 1132, "Information for Recording in Real-Time": shown, not modal, when a recording's
// analysis falls five seconds behind. "&Maximize speed" switches on boost and the low quality
// for the next song; "&Show this next time" keeps the box coming.

class QDialog;

// Shows the box (the recorder's showSpeedWarning hook); the box closes itself.
void showSpeedWarningDialog();
// The box on screen, or nullptr (tests).
QDialog* speedWarningDialog();
