// Signs in and lists the repositories the server keeps.
//
//   list_repositories HOST PORT USER PASSWORD

#include <cstdio>

#include "../common/example_session.h"

int main(int argc, char** argv)
{
    if (argc != 5) {
        std::fprintf(stderr, "usage: %s HOST PORT USER PASSWORD\n", argv[0]);
        return 2;
    }
    example::Session session;
    if (!session.signIn(argv[1], argv[2], argv[3], argv[4]))
        return 1;

    const auto server = session.text();
    if (!session.succeeded(session->getSessionProperty(*session.text("SERVER_NAME"), *server)))
        return 1;
    const auto user = session.text();
    if (const IZELServerIdentity* identity = session->getIdentity())
        identity->getId(*user);
    std::printf("signed in to %s as %s\n", server->c_str(), user->c_str());

    const auto repositories = session.own(session->createRepositoryVector());
    if (!repositories || !session.succeeded(session->getRepositoryManager()->getRepositories(nullptr, *repositories)))
        return 1;
    std::printf("%u repositories\n", repositories->entries());
    const auto repositoryName = session.text(), description = session.text();
    for (unsigned i = 0; i < repositories->entries(); ++i) {
        repositories->element(i)->getName(*repositoryName);
        repositories->element(i)->getDescription(*description);
        std::printf("  %s  %s\n", repositoryName->c_str(), description->c_str());
    }
    return 0;
}
