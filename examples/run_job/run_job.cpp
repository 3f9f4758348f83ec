// Submits a workspace of a repository as a job with published parameters, waits for it to end and
// prints its result.
//
//   run_job HOST PORT USER PASSWORD REPOSITORY WORKSPACE [NAME=VALUE]...
//
// The job service is "zeljob", the one a server offers unless configured otherwise.

#include <cstdio>
#include <cstring>

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

    example::Session::String keyword(session, "zeljob"), repository(session, argv[5]), workspace(session, argv[6]);
    IZELServerTransformationRequest* request =
        session->createTransformationRequest(*keyword, *repository, *workspace);
    for (int i = 7; i < argc; ++i) {
        const char* equals = std::strchr(argv[i], '=');
        if (equals == nullptr || equals == argv[i]) {
            std::fprintf(stderr, "error: parameter '%s' is not NAME=VALUE\n", argv[i]);
            session->destroyTransformationRequest(&request);
            return 2;
        }
        example::Session::String name(session, std::string(argv[i], static_cast<std::size_t>(equals - argv[i]))), value(session, equals + 1);
        request->setPublishedParameter(*name, *value);
    }

    unsigned jobId = 0;
    IZELServerTransformationResult* result = session->createTransformationResult();
    bool ended = session.succeeded(session->getTransformationManager()->submitJob(*request, jobId));
    if (ended) {
        std::printf("submitted job %u\n", jobId);
        ended = example::waitForJob(session, jobId, *result);
    }
    bool success = false;
    if (ended) {
        example::Session::String message(session);
        unsigned number = 0;
        result->getStatusNumber(number);
        result->getStatusMessage(*message);
        success = result->isSuccess() != 0;
        std::printf("job %u %s: %u %s\n", jobId, success ? "succeeded" : "failed", number, message.c_str());
    }
    session->destroyTransformationResult(&result);
    session->destroyTransformationRequest(&request);
    return success ? 0 : 1;
}
