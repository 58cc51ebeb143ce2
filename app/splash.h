#pragma once
// The splash window shown at start when the "Splash screen" setting is on: 475 x 386,
// centred and on top, for at least 2.5 seconds. Start-up waits one second for it.

// Shows the splash, waits one second (serving its painting) and returns; it closes itself.
void showSplashScreen();
// The splash's picture (the tests look at it).
class QPixmap;
QPixmap splashPicture();
