// Sockets: what the HTTP library does not offer: reaching a connection that it serves.
#pragma once

namespace provider {

// Sends a TCP reset to the client at clientPort that is connected to our port.
void resetConnection(int port, int clientPort);
// Ends the reading side of all connections to our port: idle ones close, answers in progress are still sent.
void endConnections(int port);

}  // namespace provider
