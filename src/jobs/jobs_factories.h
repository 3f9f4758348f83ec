#pragma once
// The session's factories for the jobs subsystem. Each returns a new object allocated through the
// library's heap, or null when memory is exhausted; the session destroys them through their
// interface (their destructors are virtual).

#include <zelserverapi/IZELServerLogFileInfo.h>
#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerTransformationManager.h>
#include <zelserverapi/IZELServerTransformationRequest.h>
#include <zelserverapi/IZELServerTransformationResult.h>
#include <zelserverapi/IZELServerWorkspace.h>

#include "transport/IZELServerChannel.h"

namespace zel {

// A job for the workspace named by `workspace` in `repository` (workspace path R/w/w.ext).
IZELServerTransformationRequest* makeTransformationRequest(const IZELServerString& keyword,
                                                           const IZELServerString& repository,
                                                           const IZELServerWorkspace& workspace);
// A job for the workspace file `workspace` in `repository`.
IZELServerTransformationRequest* makeTransformationRequest(const IZELServerString& keyword,
                                                           const IZELServerString& repository,
                                                           const IZELServerString& workspace);
// A job for a workspace path taken as given.
IZELServerTransformationRequest* makeTransformationRequest(const IZELServerString& keyword,
                                                           const IZELServerString& workspacePath);

// An empty result.
IZELServerTransformationResult* makeTransformationResult();
// A result parsed from `text`.
IZELServerTransformationResult* makeTransformationResult(const IZELServerString& text);

// A log file description of unknown size (4294967295).
IZELServerLogFileInfo* makeLogFileInfo();

// The manager bound to the session's `channel`, which it borrows. Null also when `channel` is null.
IZELServerTransformationManager* makeTransformationManager(IZELServerChannel* channel);

}  // namespace zel
