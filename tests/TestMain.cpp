#include <gtest/gtest.h>

#include <QCoreApplication>

// Every test program has a Qt application object, so that posted messages
// can be delivered and widgets can be made where a folder needs them.
#ifdef GLIMMET_TEST_WIDGETS
#include <QApplication>
using TestApplication = QApplication;
#else
using TestApplication = QCoreApplication;
#endif

int main(int argc, char** argv)
{
    ::testing::InitGoogleTest(&argc, argv);
    TestApplication application(argc, argv);
    return RUN_ALL_TESTS();
}
