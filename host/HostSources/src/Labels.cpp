#include "Labels.h"

#include <unordered_map>
#include <unordered_set>

namespace HostSources
{
namespace
{
using VCounts = std::unordered_map< std::string, std::size_t >;

VCounts CountLabels( const std::vector< std::string >& i_rLabels )
{
  VCounts Counts;
  for ( const std::string& rLabel : i_rLabels )
  {
    ++Counts[rLabel];
  }
  return Counts;
}
} // namespace

std::size_t MakeLabelsUnique( std::vector< std::string >& io_rLabels,
                              const std::vector< std::string >& i_rDescriptions )
{
  const std::vector< std::string > Before = io_rLabels;
  const VCounts FileCounts = CountLabels( Before );
  for ( std::size_t Index = 0; Index < Before.size() && Index < i_rDescriptions.size(); ++Index )
  {
    if ( !Before[Index].empty() && FileCounts.at( Before[Index] ) > 1 && !i_rDescriptions[Index].empty() )
    {
      io_rLabels[Index] = i_rDescriptions[Index];
    }
  }

  const VCounts Counts = CountLabels( io_rLabels );
  std::unordered_set< std::string > Taken( io_rLabels.begin(), io_rLabels.end() );
  VCounts Next;
  std::size_t Changed = 0;
  for ( std::size_t Index = 0; Index < Before.size(); ++Index )
  {
    std::string& rLabel = io_rLabels[Index];
    // A name that only became double by a description stays with the point that had it from the file.
    const bool bOwn = rLabel == Before[Index] && FileCounts.at( rLabel ) == 1;
    if ( !rLabel.empty() && Counts.at( rLabel ) > 1 && !bOwn )
    {
      const std::string Base = rLabel;
      do
      {
        rLabel = Base + '_' + std::to_string( ++Next[Base] );
      } while ( !Taken.insert( rLabel ).second );
    }
    Changed += rLabel != Before[Index];
  }
  return Changed;
}

} // namespace HostSources
