#pragma once
// The description of one job's log file, filled by IZELServerTransformationManager::getLogFileInfo.
// Made by IZELServerSession::createLogFileInfo and destroyed by IZELServerSession::destroyLogFileInfo.

class IZELServerLogFileInfo {
public:
    // The log's size in bytes as the server reported it; 4294967295 until a description was read
    // (and still then when the server's reply held no log description).
    virtual unsigned getSize() const = 0;
    virtual ~IZELServerLogFileInfo() = default;

protected:
    IZELServerLogFileInfo() = default;
    IZELServerLogFileInfo(const IZELServerLogFileInfo&) = default;
    IZELServerLogFileInfo& operator=(const IZELServerLogFileInfo&) = default;
};
