// One user of the campaign: a host of the client library that does what it is told, line by line.
#pragma once

namespace campaign {

/// Reads orders from standard input, one JSON object a line, and answers each with one on standard output,
/// until the order "quit" or the end of the input. The exit code of the process.
int RunWorker();

}  // namespace campaign
