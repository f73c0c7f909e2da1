// What a scene widget does as a window of subjects.

#include <HarrowGraphics/VQMLSceneWidget.h>

#include <HarrowGraphics/VHarrowSubjectScene.h>

#include <algorithm>

namespace HarrowGraphics
{

VHarrowSubjectScene* VQMLSceneWidget::SubjectScene() const
{
  return qobject_cast< VHarrowSubjectScene* >( m_Arguments.pScene.get() );
}

void VQMLSceneWidget::setPoseIndex( uint i_Index )
{
  if ( m_PoseIndex != i_Index )
  {
    m_PoseIndex = i_Index;
    ShowPoses();
  }
}

void VQMLSceneWidget::setLabellingPoseIndex( int i_Index )
{
  if ( m_LabellingPose != std::max( i_Index, -1 ) )
  {
    m_LabellingPose = std::max( i_Index, -1 );
    ShowPoses();
  }
}

void VQMLSceneWidget::setSolvingPoseIndex( int i_Index )
{
  if ( m_SolvingPose != std::max( i_Index, -1 ) )
  {
    m_SolvingPose = std::max( i_Index, -1 );
    ShowPoses();
  }
}

void VQMLSceneWidget::ShowPoses()
{
  if ( VHarrowSubjectScene* const pScene = SubjectScene() )
  {
    const auto Own = []( int i_Index )
    {
      return i_Index < 0 ? std::nullopt : std::optional( static_cast< std::uint32_t >( i_Index ) );
    };
    pScene->SetPoses( { m_PoseIndex, Own( m_LabellingPose ), Own( m_SolvingPose ) } );
  }
  emit PoseIndexChanged();
}

} // namespace HarrowGraphics
