// Front functions that ask the data-control process about the web service. Each sends one
// block; the answer arrives later as a reply (message 1127).
#pragma once

// Asks whether the web service can be reached (a connection-status block for source 2).
void DC_NET_QueryNetStatus();
