#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

namespace HostSources
{

struct VTomlValue;
using VTomlArray = std::vector< VTomlValue >;

/// A value of a TOML text. Whole numbers are numbers; dates stay texts; inline tables are arrays of their values.
struct VTomlValue
{
  std::variant< bool, double, std::string, VTomlArray > Value;

  const double* Number() const { return std::get_if< double >( &Value ); }
  const std::string* Text() const { return std::get_if< std::string >( &Value ); }
  const VTomlArray* Array() const { return std::get_if< VTomlArray >( &Value ); }
  const bool* Flag() const { return std::get_if< bool >( &Value ); }
};

struct VTomlTable
{
  std::string Name; ///< the last part of its key; empty for what stands before the first table
  std::size_t Line = 0;
  std::vector< std::pair< std::string, VTomlValue > > Values;

  /// Null when it is not there.
  const VTomlValue* Find( std::string_view i_Key ) const;
};

/// Reads tables with their keys and values; what tables belong to is not kept. False, with the line and what is wrong
/// with it, for a text that is no TOML.
bool ReadToml( std::string_view i_Text, std::vector< VTomlTable >& o_rTables, std::string& o_rMessage );

} // namespace HostSources
