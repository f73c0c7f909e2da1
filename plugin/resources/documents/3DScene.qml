import QtQuick
import Flow2Graphics 1.0

Item {
    id: root

    SceneFramebufferObject {
        id: sceneFBO

        objectName: "sceneFBO"
        anchors.fill: parent
        clip: true
        focus: true
        scene: contextFlowScene
        cameraType: contextCameraType
        focusSelection: contextFocusSelection
        tracking: contextTracking

        Component.onCompleted: {
            const window = contextThemeWindow
            setOption("BackgroundColorRGB", (Math.round(window.r * 255) << 16)
                      | (Math.round(window.g * 255) << 8) | Math.round(window.b * 255))
        }
    }

    Repeater {
        model: sceneFBO.cameraObjects

        CameraNumber {
            shown: sceneFBO.showCameraNumbers
        }
    }

    Loader {
        anchors.right: parent.right
        anchors.top: parent.top
        anchors.margins: 50
        active: sceneFBO.previewCamera !== ""

        sourceComponent: CameraPreview {
            available: Qt.size(root.width, root.height)
            camera: sceneFBO.previewCamera
            onClosed: sceneFBO.previewCamera = ""
        }
    }

    SceneContributions {
        anchors.right: parent.right
        anchors.bottom: parent.bottom
        anchors.margins: 16
        contributions: contextFlowScene ? contextFlowScene.contributions : null
        sceneItem: sceneFBO
        mostHeight: root.height / 2
        onCameraClicked: urn => contextFlowScene.SelectCamera(urn, false)
    }

    SceneToolTip {
        anchors.fill: parent
        text: sceneFBO.toolTipText
        pointer: sceneFBO.mousePos
    }

    SceneNotice {
        anchors.horizontalCenter: parent.horizontalCenter
        anchors.bottom: parent.bottom
        anchors.bottomMargin: 24
        text: sceneFBO.notice
    }
}
