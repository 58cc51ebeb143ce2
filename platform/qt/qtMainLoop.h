#pragma once
// The Qt backend of platform/mainloop: posted calls, the quit message, the capture
// notification event and the window timers, all served by the Qt event loop on the user
// interface thread. The desktop program installs it once the application object exists.

// Installs the backend (setMainLoopBackend).
void installQtMainLoop();
// Stops and forgets every timer (the application object is about to go).
void stopQtTimers();
