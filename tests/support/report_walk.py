"""Leads a report through the pages of the interactive mode, step by step, and keeps a picture of each."""
import dataclasses
import shutil

LANGUAGES = {"en": "english", "ro": "romana"}  # as the installer calls them
SUCCESS_LIMIT = 90  # seconds for collecting, packing and sending


@dataclasses.dataclass(frozen=True)
class Answers:
    name: str
    email: str
    issue: str
    description: str

    def gui_data(self, recorded):
        """What guiData.json holds of them, without the times of the recording."""
        return {"user_details": {"name": self.name, "email": self.email},
                "issue": {"name": self.issue, "description": self.description, "can_be_reproduced": recorded}}


ANSWERS = {
    "en": Answers("Zoe Țuțu-O'Brien", "zoe.tutu@example.com", "slow",
                  "Since Monday each scan takes 3 hours - \"why\"? <b>ășî</b> & more"),
    "ro": Answers("Ștefan Gâtlan", "stefan-g@example.org", "update", "Actualizările eșuează încă de luni"),
}


def choose_language(program_folder, code):
    """As the installer notes what its user chose."""
    settings = program_folder / "kitinstaller/settings"
    settings.mkdir(parents=True, exist_ok=True)
    (settings / "install_info.yaml").write_text(f"UserPreferences:\n  language: {LANGUAGES[code]}\n", encoding="utf-8")


class ReportWalk:
    """`pictures` is the folder for the pictures, made anew, or None for none."""

    def __init__(self, window, answers, pictures=None):
        self.window = window
        self.answers = answers
        self._pictures = pictures
        self._count = 0
        if pictures:
            shutil.rmtree(pictures, ignore_errors=True)

    def picture(self, name):
        self._count += 1
        if self._pictures:
            self.window.shoot(self._pictures / f"{self._count:02}-{name}.png")

    def details_wrong(self):
        """Nothing filled in, then an address that cannot be."""
        self.window.click("#details-form button")
        self.window.wait_for_text("#consent-error", ".")
        self.picture("details-empty")
        self.window.fill("#name", self.answers.name)
        self.window.fill("#email", self.answers.email.upper())
        self.window.click("#details-form button")
        self.picture("details-wrong")

    def details(self):
        self.window.fill("#name", self.answers.name)
        self.window.fill("#email", self.answers.email)
        self.window.click("#consent")
        self.picture("details-filled")
        self.window.click("#details-form button")
        self.window.wait_for_section("issue")

    def issue(self):
        self.window.click("#issue-form button.primary")
        self.picture("issue-empty")
        self.window.click(f"input[value={self.answers.issue}]")
        self.window.fill("#description", self.answers.description)
        self.picture("issue-filled")
        self.window.click("#issue-form button.primary")
        self.window.wait_for_section("reproduce")
        self.picture("reproduce")

    def start_recording(self):
        self.window.click("#reproduce-toggle")
        self.window.wait_for_enabled("#reproduce-toggle")
        self.picture("recording")

    def stop_recording(self):
        self.window.click("#reproduce-toggle")
        self.window.wait_for_enabled("#reproduce-next")
        self.picture("recorded")

    def review(self):
        self.window.click("#reproduce-next")
        self.window.wait_for_section("send")
        self.picture("review")

    def send(self):
        self.window.click("#send-button")
        self.window.wait_for_section("progress")

    def finish(self, section="success"):
        self.window.wait_for_section(section, SUCCESS_LIMIT)
        self.picture(section)

    def whole(self, while_recording=lambda: None):
        """From the first page to the beginning of the submission, with every mistake on the way."""
        self.picture("start")
        self.details_wrong()
        self.details()
        self.issue()
        self.start_recording()
        while_recording()
        self.stop_recording()
        self.review()
        self.send()

    def to_the_recording(self):
        self.details()
        self.issue()

    def to_the_review(self):
        self.to_the_recording()
        self.review()
