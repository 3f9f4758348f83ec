// Submits a workspace of a repository as a job with published parameters, waits for it to end and
// prints its result.
//
//   run_job HOST PORT USER PASSWORD REPOSITORY WORKSPACE [NAME=VALUE]...
//
// The job service is "zeljob", the one a server offers unless configured otherwise.

#include <cstdio>

#include "../common/example_session.h"

int main(int argc, char** argv)
{
    if (argc < 7) {
        std::fprintf(stderr, "usage: %s HOST PORT USER PASSWORD REPOSITORY WORKSPACE [NAME=VALUE]...\n", argv[0]);
        return 2;
    }
    example::Session session;
    if (!session.signIn(argv[1], argv[2], argv[3], argv[4]))
        return 1;

    unsigned jobId = 0;
    switch (example::submitJob(session, argv[5], argv[6], argv + 7, argc - 7, jobId)) {
    case example::Submission::BadParameter:
        return 2;
    case example::Submission::Refused:
        return 1;
    case example::Submission::Submitted:
        break;
    }
    const bool success = example::awaitSuccess(session, jobId);
    return success ? 0 : 1;
}
