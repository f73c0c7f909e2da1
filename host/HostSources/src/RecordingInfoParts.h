#pragma once

// What the files that describe a recording share.

#include <HostSources/RecordingInfo.h>

#include <rapidjson/prettywriter.h>
#include <rapidjson/stringbuffer.h>

#include <cstdint>
#include <string>
#include <vector>

namespace HostSources::InfoParts
{

using VWriter = rapidjson::PrettyWriter< rapidjson::StringBuffer >;

/// At most 511 bytes.
__attribute__( ( format( printf, 1, 2 ) ) ) std::string Format( const char* i_pFormat, ... );
/// Of a label that may be empty.
std::string Shown( const std::string& i_rLabel );

/// A key and its value; null for a number that is not finite.
void Number( VWriter& io_rWriter, const char* i_pKey, double i_Value );
void Integer( VWriter& io_rWriter, const char* i_pKey, std::int64_t i_Value );
void Text( VWriter& io_rWriter, const char* i_pKey, const std::string& i_rValue );
void Texts( VWriter& io_rWriter, const char* i_pKey, const std::vector< std::string >& i_rValues );

VRecordingInfo::VSubject DescribeSubject( const CoreMoxelTypes::VSubject& i_rSubject );
std::string SubjectText( const VRecordingInfo::VSubject& i_rSubject );
void WriteSubjects( VWriter& io_rWriter, const VRecordingInfo& i_rInfo );

VRecordingInfo::VSkeleton DescribeSkeleton( const VRecordingSkeleton& i_rSkeleton );
std::string SkeletonText( const VRecordingInfo::VSkeleton& i_rSkeleton );
void WriteSkeletons( VWriter& io_rWriter, const VRecordingInfo& i_rInfo );

} // namespace HostSources::InfoParts
