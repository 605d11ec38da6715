// Small files that several processes read and replace.
//
// Reasons are the system's own words. One thread at a time.
#pragma once

#include "Utils/UtilsIO/Descriptor.h"

#include <string>

namespace StageHost
{

enum class EFileRead
{
  Read,
  Missing,
  Failed   // also where it is no plain file
};

EFileRead ReadWholeFile( const std::string& i_rPath, std::string& o_rText, std::string& o_rReason );

// The file is the old one or the new one at any time, whatever ends the program or the machine; it is on the disk when this returns true. The new one
// has the permissions of the old one, and its owner and group where the system lets this user give them away. One process at a time: what it writes
// first goes to the path and ".new".
bool ReplaceFile( const std::string& i_rPath, const std::string& i_rText, std::string& o_rReason );

// Gives the file a name that is free: the path and ".damaged", with a number behind it from the second one on. Empty, with the reason, where
// that cannot be.
std::string SetFileAside( const std::string& i_rPath, std::string& o_rReason );

// Excludes other processes, and other locks of this one, for as long as it lives.
class VFileLock
{
public:
  // Makes the file if it is missing, and leaves it there for good. Waits; false at a signal that is handled, or where there can be no lock.
  bool Acquire( const std::string& i_rPath, std::string& o_rReason );

private:
  UtilsIO::VDescriptor m_File;
};

}
