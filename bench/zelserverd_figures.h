#pragma once
// Figures of the local server zelserverd, measured through the library: the submit-to-result time
// of a job that does nothing, cheap-command throughput with several sessions at once, and what it
// costs that an upload is acknowledged only once it is on disk.

#include <string>
#include <vector>

#include "measure.h"

namespace bench {

struct ServerFigureOptions {
    std::string zelserverd;  // the program
    std::string workDir;     // scratch space for its data directory
    unsigned jobs = 30;      // no-op jobs timed
    unsigned uploads = 30;   // small uploads timed, and rounds of the local flush comparison
    double seconds = 2;      // length of each throughput run
};

// Starts zelserverd, measures, stops it; appends the rows. Throws std::runtime_error on failure.
void measureZelserverd(const ServerFigureOptions& options, std::vector<Row>& rows);

}  // namespace bench
