#include <Flow2Graphics/VFlowSubjectSceneArrangement.h>

#include "SubjectPosing.h"

#include <algorithm>
#include <cmath>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;

constexpr double CellStep = 500;    // mm
constexpr double CellGap = 500;     // mm
constexpr double LeastHalf = 1500;  // mm
constexpr double VolumeStep = 1000; // mm
constexpr double LargestHalf = 2e9; // mm, what the numbers of a volume hold

/// Half of a side of the floor under that many cells.
std::int32_t HalfOf( std::size_t i_Cells, double i_Cell )
{
  const double Half = std::max( static_cast< double >( i_Cells ) * i_Cell / 2, LeastHalf );
  return static_cast< std::int32_t >( std::min( std::ceil( Half / VolumeStep ) * VolumeStep, LargestHalf ) );
}
} // namespace

bool VFlowSubjectSceneArrangement::Update( const Flow2TypesUtils::VTaggedCoreTypeExtractor& i_rSubjects )
{
  const bool bStructure = i_rSubjects.Changed( ZEK::FlowTag< FlowSubjectParametrised > ) ||
                          i_rSubjects.Changed( ZEK::FlowTag< FlowSubjectParametrisedForSolving > );
  const bool bSettings = i_rSubjects.Changed( ZEK::FlowTag< FlowSubjectSettings > );
  if ( bStructure || bSettings )
  {
    // Settings of a name that nobody else has shift the slots.
    Arrange( i_rSubjects );
  }
  return bStructure || bSettings;
}

void VFlowSubjectSceneArrangement::Arrange( const Flow2TypesUtils::VTaggedCoreTypeExtractor& i_rSubjects )
{
  const auto& rLabelling = i_rSubjects.Values< FlowSubjectParametrised >();
  const auto& rSolving = i_rSubjects.Values< FlowSubjectParametrisedForSolving >();
  const std::size_t Slots = i_rSubjects.Names().size();
  m_Places.assign( Slots, {} );
  std::vector< std::size_t > Standing;
  double Reach = 0;
  for ( std::size_t Slot = 0; Slot < Slots; ++Slot )
  {
    double Own = -1;
    for ( const VSubjectParametrised* const pSubject : { rLabelling[Slot], rSolving[Slot] } )
    {
      Own = pSubject ? std::max( Own, NeutralReach( *pSubject ) ) : Own;
    }
    if ( Own >= 0 )
    {
      Standing.push_back( Slot );
      Reach = std::max( Reach, Own );
    }
  }
  const double Cell = std::ceil( 2 * Reach / CellStep ) * CellStep + CellGap;
  const auto Columns = static_cast< std::size_t >( std::ceil( std::sqrt( static_cast< double >( Standing.size() ) ) ) );
  const std::size_t Rows = Columns != 0 ? ( Standing.size() + Columns - 1 ) / Columns : 0;
  const auto Centre = [Cell]( std::size_t i_Index, std::size_t i_Count )
  {
    return ( static_cast< double >( i_Index ) - ( static_cast< double >( i_Count ) - 1 ) / 2 ) * Cell;
  };
  for ( std::size_t Index = 0; Index < Standing.size(); ++Index )
  {
    m_Places[Standing[Index]] = { Centre( Index % Columns, Columns ), Centre( Rows - 1 - Index / Columns, Rows ) };
  }
  const std::int32_t X = HalfOf( Columns, Cell ), Y = HalfOf( Rows, Cell );
  m_Volume = { -X, -Y, X, Y };
}

} // namespace Flow2Graphics
