// What both node views tell the status bar of folder populations: "Populating %1" as each starts,
// and an end only when the last one running has ended (two run at once on their workers).
#include "tests/framework/NodeTestSupport.h"

#include "ClientFramework/NodeTree/DiskBrowserModel.h"
#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/Views/DiskBrowserView.h"
#include "ClientFramework/Views/DiskExplorerView.h"

#include <QCoreApplication>
#include <QSignalSpy>

#include <gtest/gtest.h>

using namespace NodeTest;

namespace {

template <typename View> class NodeViewPopulation : public ::testing::Test
{
};

using Views = ::testing::Types<Framework::DiskExplorerView, Framework::DiskBrowserView>;
TYPED_TEST_SUITE(NodeViewPopulation, Views);

// Lets every population of the model end and their ends reach the view.
bool settle(DiskBrowserModel *model)
{
    const bool done = model->waitForPopulations();
    QCoreApplication::processEvents();
    return done;
}

} // namespace

TYPED_TEST(NodeViewPopulation, TheStatusEndsWithTheLastPopulation)
{
    MemoryStorage medium(2048);
    TreeVolume volume(&medium, 30, 200);
    NodeDrive drive(&volume);
    TypeParam view(&drive, nullptr);
    DiskBrowserModel *model = view.model();

    // The root folder first (a view may have asked for it already).
    const QModelIndex rootFolder = model->index(0, 0);
    ASSERT_TRUE(rootFolder.isValid());
    if (model->canFetchMore(rootFolder))
        model->fetchMore(rootFolder);
    ASSERT_TRUE(settle(model));
    ASSERT_GE(model->rowCount(rootFolder), 2);

    QSignalSpy started(&view, &TypeParam::populationStarted);
    QSignalSpy finished(&view, &TypeParam::populationFinished);
    model->fetchMore(model->index(0, 0, rootFolder));
    model->fetchMore(model->index(1, 0, rootFolder));
    ASSERT_EQ(started.size(), 2);
    EXPECT_EQ(started[0][0].toString(), "Populating dir0");
    EXPECT_EQ(started[1][0].toString(), "Populating dir1");
    ASSERT_TRUE(settle(model));
    // Both ended: one end for the status bar, after the second.
    ASSERT_EQ(finished.size(), 1);
    EXPECT_FALSE(finished[0][0].toBool());

    // The next population has its own end again.
    model->fetchMore(model->index(2, 0, rootFolder));
    ASSERT_TRUE(settle(model));
    EXPECT_EQ(started.size(), 3);
    EXPECT_EQ(finished.size(), 2);
}
