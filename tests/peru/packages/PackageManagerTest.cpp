#include "peru/packages/PackageManager.h"
#include "peru/packages/Package.h"

#include "support/Files.h"

using namespace peru;
using tests::errorOf;
using tests::text;

namespace {

using CLog = std::vector<std::string>;

class CTestPackage : public CPackageBase {
public:
    CTestPackage(const char* name, CLog& log, const std::vector<const char*>& required = {})
        : CPackageBase(name, required), m_log(log) {}

    bool failing = false;

protected:
    void load(IPackageManager& manager) override {
        if (failing) throw CError("not today");
        m_log.push_back(text(getName()));
    }

private:
    CLog& m_log;
};

class CTestListener : public CObject, public IPackageListener {
public:
    void packageRegistered(const P<IPackage>& package) override {
        log.push_back("+" + text(package->getName()));
    }
    void packageActivated(const P<IPackage>& package) override {
        log.push_back("!" + text(package->getName()));
        if (leave) leave->removeListener(this);
    }
    IPackageManager* leave = nullptr; // removes itself when a package is activated
    CLog log;
};

} // namespace

TEST(PackageManager, BringsUpWhatIsRequiredFirstAndOnce) {
    CLog log;
    P<CPackageManager> manager = make<CPackageManager>();
    P<CTestListener> leaving = make<CTestListener>();
    P<CTestListener> listener = make<CTestListener>();
    leaving->leave = manager.get();
    manager->addListener(leaving.get());
    manager->addListener(listener.get());
    manager->registerPackage(make<CTestPackage>("top", log, std::vector{"left", "right"}));
    for (const char* name : {"left", "right"})
        manager->registerPackage(make<CTestPackage>(name, log, std::vector{"base"}));
    manager->registerPackage(make<CTestPackage>("base", log, std::vector{"top"})); // the cycle ends here
    manager->registerPackage(make<CTestPackage>("base", log));
    for (int round = 0; round < 2; ++round) EXPECT_TRUE(manager->activateByName("top"));
    EXPECT_EQ(log, (CLog{"base", "left", "right", "top"}));
    for (const P<IPackage>& package : manager->getPackages())
        EXPECT_TRUE(manager->isActive(package)) << text(package->getName());
    EXPECT_EQ(listener->log, (CLog{"+top", "+left", "+right", "+base", "!base", "!left", "!right", "!top"}));
    EXPECT_EQ(leaving->log.back(), "!base");
    EXPECT_FALSE(manager->activateByName("unknown"));
    manager->removeListener(listener.get());
}

TEST(PackageManager, LetsAFailedPackageBeTriedAgain) {
    CLog log;
    P<CPackageManager> manager = make<CPackageManager>();
    P<CTestPackage> package = make<CTestPackage>("a", log);
    package->failing = true;
    manager->registerPackage(package);
    EXPECT_THROW(manager->activateByName("a"), CError);
    EXPECT_FALSE(manager->isActive(package));
    package->failing = false;
    manager->activateByName("a");
    EXPECT_TRUE(manager->isActive(package));

    P<IPackage> orphan = make<CTestPackage>("orphan", log, std::vector{"nobody"});
    EXPECT_EQ(errorOf([&] { manager->activate(orphan); }),
              "The package 'orphan' requires the unknown package 'nobody'.");
    EXPECT_FALSE(manager->isActive(orphan));
}

TEST(PackageManager, RootActivatesEveryPackage) {
    CLog log;
    P<IPackageManager> manager = getPackageManager();
    P<IPackage> late = make<CTestPackage>("test", log, std::vector{"peru::posix", "peru"});
    manager->registerPackage(late);
    EXPECT_TRUE(manager->activateByName("peru"));
    for (const P<IPackage>& package : manager->getPackages())
        EXPECT_TRUE(manager->isActive(package)) << text(package->getName());
    EXPECT_EQ(log, CLog{"test"});
}
