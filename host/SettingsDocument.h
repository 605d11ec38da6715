// What stands in a settings file, as values of a data store. See SettingsFile.h for its form.
#pragma once

#include <nlohmann/json_fwd.hpp>

#include <string>
#include <vector>

class IDataVerifyReader;
class IDataVerifyWriter;
class VDataPath;

namespace StageHost
{

enum class ESettingsText
{
  Good,
  Damaged,
  OfLaterVersion
};

// Leaves the document alone, and gives the reason, unless the text is good.
ESettingsText ParseSettings( const std::string& i_rText, nlohmann::ordered_json& o_rDocument, std::string& o_rReason );

// Writes each value of the document with its flags and forms. What is of an unknown type, or no value of its type, is left out, a line each.
std::vector<std::string> ReadSettings( const nlohmann::ordered_json& i_rDocument, IDataVerifyWriter& io_rDataWriter );

// Takes each value of the reader into the document; what else stands there stays. False with the reason where a document cannot hold one.
bool WriteSettings( const IDataVerifyReader& i_rDataReader, nlohmann::ordered_json& io_rDocument, std::string& o_rReason );

void RemoveSettings( const std::vector<VDataPath>& i_rPaths, nlohmann::ordered_json& io_rDocument );

std::vector<VDataPath> GetSettingPaths( const nlohmann::ordered_json& i_rDocument );

}
