// The settings of devices that a person has chosen, kept in a JSON file from one run to the next:
//
//   { "version": 1, "settings": { "VideoInput.vi:0.Settings.AudioChannelCount": { "type": "uint32", "value": 2 } } }
//
// Enumerations stand there by their names. A value that its owner verifies has "verify_required" and, beside the verified value, the
// "proposed" one. Keys and settings that are not known here stay in the file as they are.
//
// The file is replaced as a whole: at any time it is the old one or the new one. Writers in several processes wait for each other by a lock
// file beside it, and each adds its change to what the others have written. A file that cannot be understood is never written over: it is
// set aside under another name.
#pragma once

#include <string>
#include <vector>

class IDataStore;
class VDataPath;

namespace StageHost
{

// In the user's folder for settings; empty where there is none.
std::string DefaultSettingsPath();

// One thread at a time.
class VSettingsFile
{
public:
  // An empty path stands for no file: nothing is restored, and nothing can be saved.
  explicit VSettingsFile( std::string i_Path ) : m_Path( std::move( i_Path ) ) {}

  const std::string& Path() const { return m_Path; }

  // Brings all values of the file into the store, with their flags and both forms. For a store that no device has written to yet. A file
  // that is not there holds nothing. What could not be brought back is told, a line each; the rest is there.
  std::vector<std::string> Restore( IDataStore& io_rDataStore );

  // The values at these paths take the place of those in the file. False with the reason, and the file as it was.
  bool Save( IDataStore& i_rDataStore, const std::vector<VDataPath>& i_rPaths, std::string& o_rError );

  // The values at these paths are no longer in the file. False with the reason, and the file as it was.
  bool Remove( const std::vector<VDataPath>& i_rPaths, std::string& o_rError );

  // The paths of the values in the file, as far as it can be read.
  std::vector<VDataPath> GetPaths() const;

private:
  const std::string m_Path;
};

}
