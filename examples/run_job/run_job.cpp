// Submits a workspace of a repository as a job with published parameters, waits for it to end and
// prints its result. Exits with 0 when the job succeeded, 3 when it failed, 4 when it was aborted, 1
// when a call failed and 2 for a bad command line, as zelctl does.
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
    return example::awaitJob(session, jobId);
}
