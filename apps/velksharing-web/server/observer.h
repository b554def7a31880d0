#ifndef VELKSHARING_WEB_SERVER_OBSERVER_H
#define VELKSHARING_WEB_SERVER_OBSERVER_H

#include "http/unique_fd.h"
#include "server/settings.h"
#include "server/supervisor.h"
#include "watch/watch.h"

namespace web {

/// The observer process: serves the metrics, and is the only one that writes the audit trail, so
/// that no worker waits for a disk or a lock. Told to stop, it goes on until the last worker has
/// ended, and stores what that had to say.
/// @param metrics_socket listens for the metrics' readers; not open where there are none.
/// @return the process's exit status.
int Observe(const Settings &settings, UniqueFd metrics_socket, watch::Watch &watch,
            WorkerSignals &signals);

}  // namespace web

#endif
