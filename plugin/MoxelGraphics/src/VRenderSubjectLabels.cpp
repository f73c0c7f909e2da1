#include <MoxelGraphics/VRenderSubjectLabels.h>

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>

#include <algorithm>
#include <cmath>
#include <unordered_map>

namespace MoxelGraphics
{
namespace
{
constexpr float AboveTop = 100; // mm
/// A name stands over what is as high as that below the top of its subject, mm: over the head, not over one marker of
/// it, or it would jump whenever another marker became the highest.
constexpr float HeadHeight = 300;

bool IsPlace( const VScenePoint& i_rPoint )
{
  return std::isfinite( i_rPoint.X ) && std::isfinite( i_rPoint.Y ) && std::isfinite( i_rPoint.Z );
}

VScenePoint PlaceOf( const VBonePose& i_rPose )
{
  return { i_rPose[3], i_rPose[7], i_rPose[11], 0 };
}

/// So much of the way to white that letters are light on any background.
std::uint32_t Lighter( std::uint32_t i_Colour, float i_Part )
{
  std::uint32_t Result = 0xFF000000;
  for ( int Shift = 0; Shift < 24; Shift += 8 )
  {
    const auto Channel = static_cast< float >( i_Colour >> Shift & 0xFF );
    Result |= static_cast< std::uint32_t >( Channel + ( 255 - Channel ) * i_Part ) << Shift;
  }
  return Result;
}

/// A stretch of a list that is as long as the list allows.
template < typename T >
std::span< const T > Stretch( const std::vector< T >& i_rList, const VSubjectRange& i_rRange )
{
  const std::size_t First = std::min< std::size_t >( i_rRange.First, i_rList.size() );
  return std::span( i_rList ).subspan( First, std::min< std::size_t >( i_rRange.Count, i_rList.size() - First ) );
}

/// Gathers places, and says where a name stands over them.
class VHead
{
public:
  explicit VHead( bool i_bYUp )
    : m_bYUp( i_bYUp )
  {
  }
  void AddTop( const VScenePoint& i_rPlace )
  {
    if ( IsPlace( i_rPlace ) )
    {
      m_Top = std::max( m_Top, Height( i_rPlace ) );
    }
  }
  void AddPart( const VScenePoint& i_rPlace )
  {
    const float Part = 1 - ( m_Top - Height( i_rPlace ) ) / HeadHeight;
    if ( IsPlace( i_rPlace ) && Part > 0 )
    {
      m_Sum[0] += i_rPlace.X * Part * Part;
      m_Sum[1] += ( m_bYUp ? i_rPlace.Z : i_rPlace.Y ) * Part * Part;
      m_Sum[2] += Part * Part;
    }
  }
  bool Get( VLabelPoint& o_rPoint ) const
  {
    if ( !( m_Sum[2] > 0 ) )
    {
      return false;
    }
    const float Across = m_Sum[0] / m_Sum[2], Along = m_Sum[1] / m_Sum[2], Up = m_Top + AboveTop;
    o_rPoint.X = Across;
    o_rPoint.Y = m_bYUp ? Up : Along;
    o_rPoint.Z = m_bYUp ? Along : Up;
    return true;
  }

private:
  float Height( const VScenePoint& i_rPlace ) const { return m_bYUp ? i_rPlace.Y : i_rPlace.Z; }

  const bool m_bYUp;
  float m_Top = -std::numeric_limits< float >::max();
  std::array< float, 3 > m_Sum{};
};

/// True when any of the places is one.
template < typename TPlaces, typename TPlaceOf >
bool FindHead( const TPlaces& i_rPlaces, TPlaceOf i_PlaceOf, bool i_bYUp, VLabelPoint& o_rPoint )
{
  VHead Head( i_bYUp );
  for ( const auto& rPlace : i_rPlaces )
  {
    Head.AddTop( i_PlaceOf( rPlace ) );
  }
  for ( const auto& rPlace : i_rPlaces )
  {
    Head.AddPart( i_PlaceOf( rPlace ) );
  }
  return Head.Get( o_rPoint );
}

// Switches of a view: bit g for a group, above them one for the markers of each, then the two kinds of names.
constexpr std::uint32_t MarkersShift = VRenderSubjectLabels::GroupCount;
constexpr std::uint32_t NamesSwitch = 1u << 2 * MarkersShift, MarkerNamesSwitch = NamesSwitch << 1;

std::uint32_t SwitchesOf( const VSceneOptions& i_rOptions )
{
  const VDisplayRecord* const Blocks[] = { &i_rOptions.PropSubject,        &i_rOptions.LabellingSubject,
                                           &i_rOptions.PropSubject,        &i_rOptions.SolvingSubject,
                                           &i_rOptions.RetargetingSubject, &i_rOptions.SceneMesh };
  static_assert( std::size( Blocks ) == VRenderSubjectLabels::GroupCount );
  std::uint32_t Switches =
      ( i_rOptions.SubjectNames ? NamesSwitch : 0 ) | ( i_rOptions.MarkerNames ? MarkerNamesSwitch : 0 );
  for ( std::size_t Group = 0; Group < std::size( Blocks ); ++Group )
  {
    Switches |= Blocks[Group]->Enabled ? 1u << Group : 0;
    Switches |= Blocks[Group]->Markers ? 1u << ( Group + MarkersShift ) : 0;
  }
  return Switches;
}

bool BelongsToAGroup( const ZEK::VSelectionItem& i_rItem )
{
  return i_rItem.Kind == ZEK::ESelectSubject || i_rItem.Kind == ZEK::ESelectRigidObject ||
         i_rItem.Kind == ZEK::ESelectSceneMesh;
}
} // namespace

VRenderSubjectLabels::VRenderSubjectLabels( VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_Labels( i_rScene.Resources() )
{
}

VRenderSubjectLabels::~VRenderSubjectLabels() = default;

void VRenderSubjectLabels::SetGroups( const VGroups& i_rGroups )
{
  m_Groups = i_rGroups;
  m_bMade = false;
}

VRenderSubjectLabels::VSeen VRenderSubjectLabels::Look( const VSceneOptions& i_rOptions ) const
{
  VSeen Seen;
  Seen.bMarkerNames = i_rOptions.MarkerNames || m_Seen.bMarkerNames;
  Seen.bYUp = m_rScene.YUp();
  Seen.Updates = m_rScene.UpdateCount();
  for ( std::size_t Index = 0; Index < GroupCount; ++Index )
  {
    if ( const VSubjectGroup* const pGroup = m_Groups[Index] )
    {
      Seen.Structure[Index] = pGroup->StructureGeneration;
      Seen.Markers[Index] = pGroup->MarkerGeneration;
      Seen.Poses[Index] = pGroup->PoseGeneration;
      Seen.Records[Index] = pGroup->RecordGeneration;
      Seen.MarkerIds[Index] = pGroup->MarkerIds.Generation;
    }
  }
  return Seen;
}

bool VRenderSubjectLabels::TextsDiffer( const VSeen& i_rNew ) const
{
  return !m_bMade || i_rNew.Structure != m_Seen.Structure || i_rNew.bMarkerNames != m_Seen.bMarkerNames;
}

/// True when they say something else than before.
bool VRenderSubjectLabels::TakeSceneLabels()
{
  m_SceneLabels = m_rScene.GetLabels( true );
  std::erase_if( m_SceneLabels,
                 []( const VSceneLabel* i_pLabel )
                 {
                   return BelongsToAGroup( i_pLabel->Item );
                 } );
  std::sort( m_SceneLabels.begin(), m_SceneLabels.end(),
             []( const VSceneLabel* i_pA, const VSceneLabel* i_pB )
             {
               return i_pA->Item < i_pB->Item;
             } );
  const bool bSame = std::equal( m_SceneLabels.begin(), m_SceneLabels.end(), m_SceneTexts.begin(), m_SceneTexts.end(),
                                 []( const VSceneLabel* i_pLabel, const std::string& i_rText )
                                 {
                                   return i_pLabel->Text == i_rText;
                                 } );
  if ( !bSame )
  {
    m_SceneTexts.clear();
    for ( const VSceneLabel* const pLabel : m_SceneLabels )
    {
      m_SceneTexts.push_back( pLabel->Text );
    }
  }
  return !bSame;
}

void VRenderSubjectLabels::MakeTexts()
{
  std::vector< VLabelText > Texts;
  std::unordered_map< std::string, std::size_t > First; // by name, into m_Named
  m_Named.clear();
  for ( std::size_t Group = 0; Group < GroupCount; ++Group )
  {
    for ( std::size_t Record = 0; m_Groups[Group] && Record < m_Groups[Group]->Records.size(); ++Record )
    {
      const std::size_t Label = Texts.size();
      AddSubject( Group, Record, Texts );
      const VNamed& rFormer = m_Named[First.emplace( Texts[Label].Text, m_Named.size() - 1 ).first->second];
      for ( std::size_t Index = Label; rFormer.Group != Group && Index < Texts.size(); ++Index )
      {
        Texts[Index].Unless = static_cast< std::int32_t >( rFormer.Label );
        Texts[Index].UnlessNeeds = 1u << rFormer.Group;
      }
    }
  }
  for ( const std::string& rText : m_SceneTexts )
  {
    Texts.push_back( { rText, 0xFFD8D8D8, ELabelPlace::Above, true, NamesSwitch } );
  }
  m_Labels.SetTexts( std::move( Texts ) );
}

void VRenderSubjectLabels::AddSubject( std::size_t i_Group, std::size_t i_Record, std::vector< VLabelText >& io_rTexts )
{
  const VSubjectGroup& rGroup = *m_Groups[i_Group];
  const VSubjectRecord& rRecord = rGroup.Records[i_Record];
  const std::uint32_t GroupSwitch = 1u << i_Group;
  m_Named.push_back( { static_cast< std::uint32_t >( i_Group ), static_cast< std::uint32_t >( i_Record ),
                       static_cast< std::uint32_t >( io_rTexts.size() ) } );
  io_rTexts.push_back(
      { rRecord.Name, Lighter( rRecord.Colour, 0.55F ), ELabelPlace::Above, true, NamesSwitch | GroupSwitch } );
  if ( !m_Seen.bMarkerNames )
  {
    return;
  }
  std::size_t Marker = rRecord.Markers.First;
  for ( const std::string& rName : Stretch( rGroup.MarkerNames, rRecord.Markers ) )
  {
    const std::uint32_t Colour = Marker < rGroup.MarkerColours.size() ? rGroup.MarkerColours[Marker] : 0xFFFFFFFF;
    ++Marker;
    io_rTexts.push_back( { rName, Lighter( Colour, 0.6F ), ELabelPlace::Beside, false,
                           MarkerNamesSwitch | GroupSwitch | GroupSwitch << MarkersShift } );
  }
}

void VRenderSubjectLabels::PlaceSubject( const VNamed& i_rNamed )
{
  const VSubjectGroup& rGroup = *m_Groups[i_rNamed.Group];
  const VSubjectRecord& rRecord = rGroup.Records[i_rNamed.Record];
  VLabelPoint& rPoint = m_Labels.Points()[i_rNamed.Label];
  const auto Itself = []( const VScenePoint& i_rPlace )
  {
    return i_rPlace;
  };
  const bool bYUp = m_Seen.bYUp;
  rPoint.bShown = FindHead( Stretch( rGroup.Markers, rRecord.Markers ), Itself, bYUp, rPoint ) ||
                  FindHead( Stretch( rGroup.Poses, rRecord.Bones ), PlaceOf, bYUp, rPoint ) ||
                  FindHead( Stretch( rGroup.Solved, rRecord.Markers ), Itself, bYUp, rPoint ) ||
                  FindHead( std::span( &rRecord.Root, 1 ), PlaceOf, bYUp, rPoint );
  Mark( rPoint, ( rRecord.Flags & CoreGraphics::EInstanceSelected ) != 0 );
}

void VRenderSubjectLabels::PlaceMarkers( const VNamed& i_rNamed )
{
  const VSubjectGroup& rGroup = *m_Groups[i_rNamed.Group];
  const VSubjectRange& rRange = rGroup.Records[i_rNamed.Record].Markers;
  const auto Places = Stretch( rGroup.Markers, rRange );
  const std::size_t Names = Stretch( rGroup.MarkerNames, rRange ).size();
  const std::vector< std::uint8_t >& rFlags = rGroup.MarkerIds.Flags;
  for ( std::size_t Index = 0; Index < Names; ++Index )
  {
    VLabelPoint& rPoint = m_Labels.Points()[i_rNamed.Label + 1 + Index];
    rPoint.bShown = Index < Places.size() && IsPlace( Places[Index] );
    if ( rPoint.bShown )
    {
      const VScenePoint& rPlace = Places[Index];
      const std::size_t Marker = rRange.First + Index;
      rPoint.X = rPlace.X;
      rPoint.Y = rPlace.Y;
      rPoint.Z = rPlace.Z;
      rPoint.Radius = std::isfinite( rPlace.Radius ) ? std::clamp( rPlace.Radius, 0.0F, 100.0F ) : 0.0F;
      Mark( rPoint, Marker < rFlags.size() && ( rFlags[Marker] & CoreGraphics::EInstanceSelected ) != 0 );
    }
  }
}

void VRenderSubjectLabels::Mark( VLabelPoint& o_rPoint, bool i_bOn )
{
  m_bMarksDiffer |= o_rPoint.bMarked != i_bOn;
  o_rPoint.bMarked = i_bOn;
}

void VRenderSubjectLabels::Place()
{
  m_bMarksDiffer = false;
  for ( const VNamed& rNamed : m_Named )
  {
    PlaceSubject( rNamed );
    if ( m_Seen.bMarkerNames )
    {
      PlaceMarkers( rNamed );
    }
  }
  const std::size_t First = m_Labels.Count() - m_SceneLabels.size();
  for ( std::size_t Index = 0; Index < m_SceneLabels.size(); ++Index )
  {
    const auto& [rItem, rPosition, bFlag, rText] = *m_SceneLabels[Index];
    VLabelPoint& rPoint = m_Labels.Points()[First + Index];
    Mark( rPoint, bFlag );
    rPoint = { rPosition[0], rPosition[1], rPosition[2], 0, true, bFlag };
  }
  m_Labels.Moved( m_bMarksDiffer );
}

void VRenderSubjectLabels::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                   std::uint32_t i_Pass )
{
  if ( i_Pass != ERenderPassOverlay || io_rContext.RenderMode() != ERenderModeNormal || i_rOptions.CameraView ||
       !i_rOptions.Show3DOverlay || !i_rOptions.OverlayCamera.isEmpty() ||
       !( i_rOptions.SubjectNames || i_rOptions.MarkerNames ) )
  {
    return;
  }
  const VSeen New = Look( i_rOptions );
  if ( !m_bMade || !( New == m_Seen ) )
  {
    const bool bUpdated = !m_bMade || New.Updates != m_Seen.Updates;
    const bool bTexts = TextsDiffer( New );
    m_Seen = New;
    m_bMade = true;
    // A short circuit would leave labels that are gone.
    if ( ( bUpdated && TakeSceneLabels() ) || bTexts )
    {
      MakeTexts();
    }
    Place();
  }
  const float Distance = std::isfinite( i_rOptions.LabelDistance ) ? i_rOptions.LabelDistance : 0.0F;
  m_Labels.Draw( io_rContext, { i_rOptions.LabelSize, Distance, i_rOptions.LabelLimit, SwitchesOf( i_rOptions ) },
                 m_rScene.IsSettled() );
}

} // namespace MoxelGraphics
