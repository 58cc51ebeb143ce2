// The zoom factor and its commands.
#include "shell/zoom.h"

#include "shell/commandTable.h"

ZoomState zoomState;

void resetZoom() { zoomState = ZoomState{}; }

int zoomCommand(int command) {
    double z;
    switch (command) {
    case CMD_ZOOM_50: z = 2.0; break;
    case CMD_ZOOM_100: z = 4.0; break;
    case CMD_ZOOM_200: z = 8.0; break;
    case CMD_ZOOM_IN: z = zoomState.zoomFactor * ZOOM_IN_STEP; break;
    case CMD_ZOOM_OUT: z = zoomState.zoomFactor * ZOOM_OUT_STEP; break;
    default: return 0;
    }
    if (z < ZOOM_MINIMUM || z > ZOOM_MAXIMUM) return 0;
    zoomState.zoomFactor = z;
    return 1;
}

int zoomPercent() { return int(zoomState.zoomFactor * 25.0 + 0.5); }
