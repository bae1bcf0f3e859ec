#include "system/LegacyTimeZoneTable.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// scripts/make-timezone-ini reads the rows below (one per line) to build data/timezone.ini.
std::vector<LegacyTimeZone> BuiltInLegacyTimeZones() {
    // clang-format off
    return {
        {"UTC12", "UTC12UDT", -1200},
        {"BST11", "BST11BDT", -1100},
        {"HST10", "HST10HDT", -1000},
        {"MART9:30", "MART9:30MARDT", -950},
        {"AST9", "AST9ADT", -900},
        {"PST8", "PST8PDT", -800},
        {"MST7", "MST7MDT", -700},
        {"CST6", "CST6CDT", -600},
        {"EST5", "EST5EDT", -500},
        {"AST4", "AST4ADT", -400},
        {"NST3:30", "NST3:30NDT", -350},
        {"GRNLNDST3", "GRNLNDST3GRNLNDDT", -300},
        {"FALKST2", "FALKST2FALKDT", -200},
        {"AZOREST1", "AZOREST1AZOREDT", -100},
        {"CUT0", "CUT0GDT", 0},
        {"GMT0", "GMT0BST", 0},
        {"NFT-1", "NFT-1DFT", 100},
        {"WET-2", "WET-2WET", 200},
        {"USAST-2", "USAST-2USADT", 200},
        {"SAUST-3", "SAUST-3SAUDT", 300},
        {"MEST-3", "MEST-3MEDT", 300},
        {"IRST-3:30", "IRST-3:30IRDT", 350},
        {"WST-4", "WST-4WDT", 400},
        {"AFT-4:30", "AFT-4:30AFDT", 450},
        {"PAKST-5", "PAKST-5PAKDT", 500},
        {"IST-5:30", "IST-5:30IDT", 550},
        {"NPT-5:45", "NPT-5:45NPDT", 575},
        {"TASHST-6", "TASHST-6TASHDT", 600},
        {"MMT-6:30", "MMT-6:30MMDT", 650},
        {"THAIST-7", "THAIST-7THAIDT", 700},
        {"WAUST-8", "WAUST-8WAUDT", 800},
        {"TAIST-8", "TAIST-8TAIDT", 800},
        {"CWST-8:45", "CWST-8:45AW", 875},
        {"JST-9", "JST-9JSTDT", 900},
        {"KORST-9", "KORST-9KORDT", 900},
        {"CST-9:30", "CST-9:30AS", 950},
        {"EET-10", "EET-10EETDT", 1000},
        {"LHST-10:30", "LHST-10:30LH", 1050},
        {"MET-11", "MET-11METDT", 1100},
        {"NFT-11:30", "NFT-11:30NFDT", 1150},
        {"NZST-12", "NZST-12NZDT", 1200},
        {"CHAST-12:45", "CHAST-12:45CHADT", 1275},
        {"TOT-13", "TOT-13TDT", 1300},
    };
    // clang-format on
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
