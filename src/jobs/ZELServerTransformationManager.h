#pragma once
// The library's transformation manager (see IZELServerTransformationManager): every operation is one
// command through the session's channel. The base carries the transact operations, which wait for
// the job and receive its result on the result port; the manager adds the rest and forwards the
// transact operations to its base.

#include <zelserverapi/IZELServerTransformationManager.h>

#include "api/heap.h"
#include "transport/IZELServerChannel.h"

namespace zel {

class ZELServerBaseTransformationManager : public IZELServerBaseTransformationManager, public HeapObject {
public:
    // `channel` is the session's; it is borrowed, never destroyed here.
    explicit ZELServerBaseTransformationManager(IZELServerChannel* channel) : channel_(channel) {}
    ~ZELServerBaseTransformationManager() override;

    IZELServerStatus* transactJob(const IZELServerTransformationRequest& request,
                                  IZELServerTransformationResult& result) override;
    IZELServerStatus* transactJobString(const IZELServerString& keyword, const IZELServerString& requestText,
                                        const IZELServerStringArray& directives, IZELServerString& resultText) override;

protected:
    IZELServerChannel* channel() const { return channel_; }

private:
    IZELServerStatus* transact(const IZELServerString& keyword, const IZELServerString& requestText,
                               const IZELServerStringArray& directives, const IZELServerStringArray& notifications,
                               IZELServerString& resultText);

    IZELServerChannel* channel_;
};

// Not final: scheduleJob, scheduleJobString and getJobResult reach the operations they build on
// through the virtual table, so a derived manager's versions take part.
class ZELServerTransformationManager : public IZELServerTransformationManager,
                                       public ZELServerBaseTransformationManager {
public:
    explicit ZELServerTransformationManager(IZELServerChannel* channel) : ZELServerBaseTransformationManager(channel) {}
    ~ZELServerTransformationManager() override = default;

    IZELServerStatus* transactJob(const IZELServerTransformationRequest& request,
                                  IZELServerTransformationResult& result) override;
    IZELServerStatus* transactJobString(const IZELServerString& keyword, const IZELServerString& requestText,
                                        const IZELServerStringArray& directives, IZELServerString& resultText) override;
    IZELServerStatus* submitJob(const IZELServerTransformationRequest& request, unsigned& jobId) override;
    IZELServerStatus* submitJobString(const IZELServerString& keyword, const IZELServerString& requestText,
                                      const IZELServerStringArray& directives, unsigned& jobId) override;
    IZELServerStatus* scheduleJob(const IZELServerTransformationRequest& request, unsigned secondsFromNow,
                                  unsigned& jobId) override;
    IZELServerStatus* scheduleJobString(const IZELServerString& keyword, const IZELServerString& requestText,
                                        unsigned secondsFromNow, const IZELServerStringArray& directives,
                                        unsigned& jobId) override;
    IZELServerStatus* abortJob(unsigned jobId) override;
    IZELServerStatus* getJobResult(unsigned jobId, unsigned& found, IZELServerTransformationResult& result) override;
    IZELServerStatus* getJobResultString(unsigned jobId, unsigned& found, IZELServerString& resultText) override;
    IZELServerStatus* logFileExists(unsigned jobId, unsigned& exists) override;
    IZELServerStatus* getLogFileInfo(unsigned jobId, IZELServerLogFileInfo& info, unsigned& found) override;
    IZELServerStatus* getLogFile(unsigned jobId, const IZELServerString& localPath, unsigned& success) override;
    unsigned reserved() const override { return 0; }

private:
    IZELServerStatus* submit(const IZELServerString& keyword, const IZELServerString& requestText,
                             const IZELServerStringArray& directives, const IZELServerStringArray* notifications,
                             unsigned& jobId);
};

}  // namespace zel
