// That the kernels under test are those asked for.
#include <cstdlib>
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <kel/kelImage.h>
#include <string>

TEST(Kernels, AreThoseOfTheLibraryAskedFor) {
    const char* const set = std::getenv("KEL_KERNELS");
    Dl_info info = {};
    ASSERT_NE(dladdr(reinterpret_cast<void*>(&convertKelImage), &info), 0);
    const std::string folder = set ? std::string("/kernels/") + set + "/" : "/kernels/";
    EXPECT_EQ(std::string(info.dli_fname).find(folder) != std::string::npos, set != nullptr) << info.dli_fname;
}
