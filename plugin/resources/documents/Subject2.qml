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

        Component.onCompleted: {
            const window = contextThemeWindow
            setOption("BackgroundColorRGB", (Math.round(window.r * 255) << 16)
                      | (Math.round(window.g * 255) << 8) | Math.round(window.b * 255))
        }
    }

    Text {
        objectName: "noSubjects"
        anchors.centerIn: parent
        visible: contextFlowScene !== null && contextFlowScene.subjectNames.length === 0
        text: qsTr("No %1s to pose").arg(contextSubjectNoun.toLowerCase())
        color: "#808489"
        font.pixelSize: 20
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
