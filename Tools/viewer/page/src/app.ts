// The page: a recording, a player, and everything that shows where they are.

import { adjustmentIn, asRecorded, isSame, partsOfAdjustment, shifted, type Adjustment } from './adjust/adjustment';
import { showAdjusting } from './adjust/dialog';
import { Decoder } from './decoder/client';
import { embeddedRecording, type EmbeddedRecording, type PackedText } from './decoder/embedded';
import { EntriesPane } from './entries/pane';
import { showCheck, showFacts } from './facts/pane';
import { InsightTables } from './insights/tables';
import type { Range } from './lanes/axis';
import { arrangeLanes } from './lanes/dialog';
import { Timeline } from './lanes/timeline';
import { assumption } from './model/checks';
import { clock, shown } from './model/format';
import { decimal } from './model/decimals';
import { joined, type Joined } from './model/joining';
import { markerAfter, markerBefore } from './model/markers';
import { Session, type Decoded } from './model/session';
import { linkTo, linkToView, partsOf, rangeIn, rangeText, timeInLink, withParts } from './model/link';
import { NotesPane } from './notes/pane';
import { RangeBar } from './range/bar';
import { Selection } from './range/selection';
import { zoomStage } from './stage/handling';
import { layers } from './stage/layers';
import { Player } from './stage/player';
import { Stage } from './stage/stage';
import { afterIdle } from './transport/skipping';
import { setUpAutomation } from './ui/automation';
import { setUpControls, type Controls } from './ui/controls';
import { ask, setUpDialogs } from './ui/dialogs';
import { breath } from './ui/breath';
import { announce, byId, setText } from './ui/dom';
import { setUpDrop } from './ui/drop';
import { placeIcons } from './ui/icons';
import { setUpKeys } from './ui/keys';
import { mark, measured } from './ui/marks';
import type { Page } from './ui/page';
import { saveBlob } from './ui/save';
import { setUpSplitters } from './ui/splitter';
import { setUpTabs, showTab } from './ui/tabs';
import { setUpTheme } from './ui/theme';

export class App implements Page {
  readonly player = new Player(byId<HTMLVideoElement>('movie'));
  readonly decoder = new Decoder();
  readonly selection = new Selection();
  skipsIdle = false;
  private readonly insights = new InsightTables({
    ask: async (name, parameters) => (await this.decoder.insights({ name, parameters }))[0]!,
    onLoaded: () => this.requestFrame(),
    onProblem: (text) => this.complain(text),
  });
  readonly stage = new Stage(this.player, this.insights);
  /// As it is recorded, and how the reader says that it belongs to the movie.
  private decoded: Decoded | undefined;
  private adjustment = asRecorded;
  session: Session | undefined;
  private movieUrl = '';
  private movieName = '';
  private isFramePending = false;
  private onlyTimeMoves = false;
  private shownMovie = '';
  private drawnTime = -1;
  private opened = 0;
  /// The recording whose entries are shown as the address says.
  private linked: Session | undefined;
  finished = 0;
  private controls!: Controls;
  private readonly timeline: Timeline;
  private readonly entries: EntriesPane;
  private readonly notes: NotesPane;
  private readonly usualLayers = layersOn();
  private readonly rangeBar: RangeBar;

  constructor() {
    const showsKeys = () => this.stage.showsKeys;
    this.timeline = new Timeline({
      showsKeys,
      region: () => this.stage.placement.region,
      notes: () => this.notes.all,
      onSeek: (time) => this.seek(time),
      onRange: () => {
        this.rangeChanged();
        this.writeLink();
      },
      onSelect: (one, other) => this.selection.select(one, other),
      onExtend: (time) => {
        this.selection.extend(this.player.time, time);
        this.seek(time);
      },
    });
    this.entries = new EntriesPane({
      showsKeys,
      onSeek: (time) => this.seek(time),
      onSave: () => void this.save(),
      onProblem: (text) => this.complain(text),
      onChange: () => this.writeLink(),
    });
    this.notes = new NotesPane({
      time: () => this.player.time,
      onSeek: (time) => this.seek(time),
      onProblem: (text) => this.complain(text),
      onChange: () => {
        this.timeline.refreshLanes();
        this.requestFrame();
      },
    });
    this.rangeBar = new RangeBar(this.selection, {
      insights: (range) => this.insightsIn(range),
      movieName: () => this.fileName(),
      link: () => location.href.replace(/#.*/, '') + this.link(),
      onZoom: (range) => this.timeline.setRange(range),
      onFilter: ({ from, to }) => {
        showTab('tab-entries');
        this.entries.showBetween(from, to);
      },
      onProblem: (text) => this.complain(text),
    });
    this.selection.onChange = () => this.selectionChanged();
  }

  start(): void {
    mark('zulm:start');
    if (document.getElementById('zulm-recording')) this.decoder.prepare();
    placeIcons();
    setUpTabs(() => this.requestFrame());
    setUpSplitters();
    setUpDialogs();
    setUpDrop((files) => void this.openFiles(files));
    this.controls = setUpControls(this);
    setUpKeys(this);
    setUpAutomation(this);
    setUpTheme(() => {
      this.timeline.invalidate();
      this.requestFrame();
    });
    byId('notice-close').addEventListener('click', () => void (byId('notice').hidden = true));
    window.addEventListener('hashchange', () => {
      this.followLink();
      this.followLinkToEntries();
    });
    this.player.onChange = () => this.playerChanged();
    this.player.onPicture = () => this.pictureChanged();
    this.player.skip = (time) => (this.skipsIdle ? afterIdle(this.session?.idle ?? [], time) : undefined);
    this.stage.images.onDecoded = () => this.requestFrame();
    this.openEmbedded();
  }

  // Opening

  private openEmbedded(): void {
    let embedded: EmbeddedRecording | undefined;
    try {
      embedded = embeddedRecording();
    } catch (error) {
      return this.complain(`This page's recording cannot be read: ${wordsOf(error)}.`);
    }
    if (!embedded) return;
    const { metadata, name, movie, info, verify } = embedded;
    this.setMovie(movie, movie ?? '');
    void this.open(metadata, name, (decoded) => ({
      ...decoded,
      info,
      verify,
      duration: info.duration ?? decoded.duration,
    }));
  }

  /// One recording: a movie, or stream files, or both.
  async openFiles(files: File[]): Promise<void> {
    let recording: Joined;
    try {
      recording = joined(files);
    } catch (error) {
      ++this.finished;
      return this.complain(`The files cannot be opened: ${wordsOf(error)}.`);
    }
    const { contents, name, movie } = recording;
    const url = movie ? URL.createObjectURL(movie) : null;
    await this.open(contents, name, (decoded) => {
      this.setMovie(url, movie?.name ?? '');
      history.replaceState(null, '', linkTo(0)); // the address told a time of the recording before
      return decoded;
    });
    if (url !== null && this.movieUrl !== url) URL.revokeObjectURL(url);
  }

  /// What is open stays where the new one cannot be read.
  private async open(source: Blob | PackedText, name: string, complete: (decoded: Decoded) => Decoded): Promise<void> {
    const opening = ++this.opened;
    document.body.classList.add('is-busy');
    setText(byId('welcome-title'), `Opening ${shown(name)}…`);
    try {
      if (source instanceof Blob && source.size === 0) throw new Error('it is empty');
      const { id, decoded, problems } = await this.decoder.open(source, name);
      if (opening !== this.opened) return;
      mark('zulm:decoded');
      if (decoded.streams.length === 0 && decoded.hidden.length === 0) throw new Error(whyNothing(decoded));
      byId('notice').hidden = true;
      await breath(); // each step by itself, so that the page goes on
      if (opening !== this.opened) return;
      const completed = complete(decoded);
      const adjustment = adjustmentIn(location.hash);
      const session = sessionOf(completed, adjustment);
      await breath();
      if (opening !== this.opened) return;
      [this.decoded, this.adjustment] = [completed, adjustment];
      this.show(session);
      this.decoder.keep(id);
      if (problems.length > 0) this.complain(`Not everything could be read. ${problems.join('; ')}.`);
    } catch (error) {
      if (opening !== this.opened) return;
      this.complain(`${name} cannot be shown: ${wordsOf(error, name)}.`);
      this.decoder.keep();
    } finally {
      if (opening === this.opened) this.isOpened();
      ++this.finished;
    }
  }

  private isOpened(): void {
    document.body.classList.remove('is-busy');
    setText(byId('welcome-title'), 'Drop a recording here');
  }

  private setMovie(url: string | null, name: string): void {
    if (this.movieUrl.startsWith('blob:')) URL.revokeObjectURL(this.movieUrl);
    this.movieUrl = url ?? '';
    this.movieName = name.startsWith('data:') ? '' : name;
  }

  private show(session: Session): void {
    this.session = session;
    document.body.classList.remove('is-empty');
    document.title = `${shown(session.name)} – ZULMetaData`;
    setText(byId('recording-name'), shown(session.name));
    const canHavePictures = session.container !== 'stream';
    this.player.load(this.movieUrl && canHavePictures ? this.movieUrl : null, session.duration, session.movieDuration === undefined);
    this.notes.show(session);
    this.selection.start(this.player.duration);
    this.showSession(session);
    this.stage.zoom.reset();
    this.selectionChanged();
    this.followLink();
    this.frame();
    mark('zulm:first-picture');
    setTimeout(() => this.showDetails(session));
  }

  private adjustedSession(): Session {
    return sessionOf(this.decoded!, this.adjustment);
  }

  private showSession(session: Session): void {
    this.session = session;
    this.insights.start(session.duration, this.adjustment.offset);
    this.stage.show(session);
    this.timeline.show(session, this.player.duration);
  }

  /// The movie goes on, and only what belongs to it changes.
  private adjust(adjustment: Adjustment): void {
    if (!this.decoded || isSame(adjustment, this.adjustment)) return;
    this.adjustment = adjustment;
    const session = this.adjustedSession();
    this.player.setLength(session.duration, session.movieDuration === undefined);
    this.showSession(session);
    this.selection.setDuration(this.player.duration);
    this.rangeBar.forget();
    this.selectionChanged();
    this.showDetails(session);
    this.writeLink();
  }

  /// Shows what is open over another movie.
  private useMovie(movie: File): void {
    if (!this.decoded) return;
    this.setMovie(URL.createObjectURL(movie), movie.name);
    const { duration: _, ...decoded } = this.decoded;
    this.decoded = { ...decoded, duration: undefined };
    const session = this.adjustedSession();
    this.player.load(this.movieUrl, session.duration, true);
    this.showSession(session);
    this.showDetails(session);
  }

  /// What may come after the first picture.
  private showDetails(session: Session): void {
    if (session !== this.session) return;
    this.entries.show(session);
    this.followLinkToEntries();
    showFacts(session, this.player.duration, this.adjustment, {
      onAdjust: () =>
        showAdjusting(this.adjustment, {
          onAdjust: (adjustment) => this.adjust(adjustment),
          onMovie: (movie) => this.useMovie(movie),
        }),
    });
    showCheck(session, this.player.size);
    this.requestFrame();
    void this.stage.images.prepare(session.appearances);
    announce(`${shown(session.name)} is open`);
  }

  // Time

  seek(time: number): void {
    this.player.seek(time);
    this.timeline.reveal(this.player.time);
  }

  step(seconds: number): void {
    this.seek(this.player.time + seconds);
  }

  stepFrame(direction: 1 | -1): void {
    this.player.stepFrame(direction);
    this.timeline.reveal(this.player.time);
  }

  stepMarker(direction: 1 | -1): void {
    const markers = this.session?.markers ?? new Float64Array();
    const { time } = this.player;
    const marker = direction > 0 ? markerAfter(markers, time) : markerBefore(markers, time);
    if (marker === undefined) return announce(direction > 0 ? 'No further marker' : 'No marker before');
    this.seek(marker);
    announce(`Marker at ${clock(marker)}`);
  }

  stepMatch(direction: 1 | -1): void {
    showTab('tab-entries');
    this.entries.step(direction);
  }

  zoom(factor: number): void {
    if (factor === 0) this.timeline.showAll();
    else this.timeline.zoom(factor);
  }

  pan(part: number): void {
    this.timeline.pan(part);
  }

  /// Parts that the address lacks change nothing.
  private followLink(): void {
    if (!this.session) return;
    const parts = partsOf(location.hash);
    if (parts.has('offset') || parts.has('region')) this.adjust(adjustmentIn(location.hash));
    const zoom = rangeIn(parts.get('zoom'));
    if (zoom) this.timeline.setRange(zoom);
    const time = timeInLink(location.hash);
    if (time !== undefined && Math.abs(time - this.player.time) > 0.0005) this.seek(time);
    const wanted = parts.get('layers')?.split(',');
    if (wanted) for (const layer of layers) layer.isOn = wanted.includes(layer.id);
    const range = rangeIn(parts.get('range'));
    if (range && parts.get('range') !== this.rangeInLink()) this.selection.select(range.from, range.to);
    this.controls.showState();
    this.requestFrame();
  }

  private rangeInLink(): string | undefined {
    const { range } = this.selection;
    return range && rangeText(range);
  }

  /// The address of what is shown, after "#".
  private link(): string {
    const on = layersOn();
    const others = withParts(location.hash, [['range', this.rangeInLink()], ...partsOfAdjustment(this.adjustment)]);
    return linkToView(others, {
      time: this.player.time,
      zoom: this.timeline.zoomed,
      stream: this.entries.chosenStream,
      filter: this.entries.filterText,
      layers: on.join() === this.usualLayers.join() ? undefined : on,
    });
  }

  private followLinkToEntries(): void {
    const parts = partsOf(location.hash);
    this.entries.look(parts.get('stream'), parts.get('filter'));
    this.linked = this.session;
  }

  /// The address tells what is shown, but not sixty times a second: browsers allow few changes.
  private writeLink = debounced(() => {
    if (!this.session || this.linked !== this.session || this.player.playing) return;
    const link = this.link();
    if (link !== location.hash) history.replaceState(null, '', link);
  }, 300);

  // What is shown

  switchLayer(id: string): void {
    const layer = layers.find((layer) => layer.id === id);
    if (!layer) return;
    layer.isOn = !layer.isOn;
    this.controls.showState();
    announce(`${layer.name} ${layer.isOn ? 'shown' : 'hidden'}`);
    this.writeLink();
    this.requestFrame();
  }

  switchKeys(): void {
    this.stage.showsKeys = !this.stage.showsKeys;
    this.controls.showState();
    this.entries.refresh();
    this.timeline.invalidate();
    announce(this.stage.showsKeys ? 'Keys are shown' : 'Keys are masked');
    this.requestFrame();
  }

  arrangeLanes(): void {
    arrangeLanes(this.timeline);
  }

  writeNote(): void {
    showTab('tab-notes');
    this.notes.focusField();
  }

  findEntries(): void {
    showTab('tab-entries');
    this.entries.focusFilter();
  }

  // The selection

  private selectionChanged(): void {
    const { range, loops } = this.selection;
    this.player.loop = loops ? range : undefined;
    this.timeline.showSelection(range);
    this.rangeBar.show();
    this.rangeChanged();
    this.writeLink();
  }

  /// The heat map tells of the selection, or of what the lanes show.
  private rangeChanged(): void {
    const { range, hasHeat } = this.selection;
    const { from, to } = hasHeat && range ? range : this.timeline.range;
    const heat = layers.find(({ id }) => id === 'heat')!;
    if (hasHeat && !heat.isOn) this.switchLayer('heat');
    this.stage.setHeatRange(from, to);
    this.requestFrame();
  }

  /// The range is one of the movie.
  private insightsIn({ from, to }: Range): ReturnType<Decoder['insights']> {
    const { offset } = this.adjustment;
    const parameters = { start: from - offset, end: to - offset };
    return this.decoder.insights({ name: 'activity', parameters }, { name: 'applications', parameters });
  }

  selectSome(): void {
    this.timeline.selectSome();
  }

  switchLoop(): void {
    this.rangeBar.switchLoop();
  }

  // The movie

  switchSkipping(): void {
    this.skipsIdle = !this.skipsIdle;
    this.controls.showState();
    announce(this.skipsIdle ? 'Idle times are skipped' : 'Idle times are played');
  }

  zoomMovie(factor: number): void {
    zoomStage(this.stage.zoom, factor);
  }

  /// The name of the movie's file.
  private fileName(): string {
    const [name = ''] = this.movieName.split(/[\\/]/).slice(-1);
    return this.movieUrl.startsWith('blob:') || !name ? name || this.session?.name || 'recording' : decodedName(name);
  }

  saveStill(): void {
    const name = `${this.session?.name ?? 'recording'} ${decimal(this.player.time)}.png`;
    this.stage.still().then(
      (picture) => saveBlob(name, picture),
      (error) => this.complain(`The picture could not be saved: ${stillProblem(error)}.`),
    );
  }

  private playerChanged(): void {
    const { session, player } = this;
    if (session) {
      this.timeline.setDuration(player.duration);
      this.selection.setDuration(player.duration);
    }
    this.stage.lay();
    if (session && player.movie !== this.shownMovie) {
      this.shownMovie = player.movie;
      this.timeline.invalidate(); // the movie may show another part of the screen
      showCheck(session, player.size);
    }
    this.controls.showState();
    this.tellOfMovie();
    this.writeLink();
    this.requestFrame();
  }

  /// Picture and overlay are drawn together, before the browser shows either.
  private pictureChanged(): void {
    this.stage.drawPicture();
    this.frame();
  }

  private tellOfMovie(): void {
    const note = byId('stage-note');
    const { movie } = this.player;
    note.hidden = !this.session || movie === 'ready' || movie === 'loading';
    const name = this.movieName || 'The movie';
    const reason =
      movie === 'none'
        ? 'There is no movie with this recording.'
        : this.movieUrl.startsWith('blob:')
          ? `This browser can show no pictures of ${name}.`
          : `${name} is not beside this page, or has no pictures that this browser can show.`;
    const stand = this.session?.region ? 'The recorded region stands for it.' : assumption(undefined);
    setText(note, shown(`${reason} ${stand}`));
  }

  complain(text: string): void {
    setText(byId('notice-text'), shown(text));
    byId('notice').hidden = false;
  }

  requestFrame(): void {
    this.onlyTimeMoves = false;
    if (this.isFramePending) return;
    this.isFramePending = true;
    requestAnimationFrame((now) => {
      this.isFramePending = false;
      this.player.tick(now);
      if (this.drawnTime !== this.player.time || !this.onlyTimeMoves) this.frame();
      this.onlyTimeMoves = false;
      if (!this.player.playing) return;
      this.requestFrame();
      this.onlyTimeMoves = true;
    });
  }

  private frame(): void {
    if (!this.session) return;
    measured('zulm:frame', () => {
      const { time, playing } = this.player;
      this.drawnTime = time;
      if (playing) this.timeline.reveal(time);
      this.stage.draw(time);
      this.timeline.draw(time);
      this.controls.showTime(time, this.player.duration);
      this.entries.setTime(time);
    });
  }

  // Saving

  private async save(): Promise<void> {
    const hasKeys = (this.session?.track('keyboardAction')?.count ?? 0) > 0;
    if (hasKeys && !this.stage.showsKeys) {
      const agrees = await ask(
        'Save with everything that was typed?',
        'The file will hold every key in clear, though this page masks them.',
        'Save',
      );
      if (!agrees) return;
    }
    try {
      const contents = new Blob([await this.decoder.dump()], { type: 'application/json' });
      saveBlob(`${this.session?.name ?? 'recording'}.json`, contents);
    } catch (error) {
      this.complain(`The entries could not be saved: ${wordsOf(error)}.`);
    }
  }
}

function sessionOf(decoded: Decoded, { offset, region }: Adjustment): Session {
  return new Session(shifted(decoded, offset), region);
}

/// A page writes names in addresses with percent signs.
function decodedName(name: string): string {
  try {
    return decodeURIComponent(name);
  } catch {
    return name;
  }
}

function stillProblem(error: unknown): string {
  return error instanceof DOMException && error.name === 'SecurityError'
    ? 'the browser does not let a page read a movie beside it. Choose the movie under Facts, Adjust, or drop it on the page, and save the picture then'
    : wordsOf(error);
}

/// Without the name of the file in front, where the sentence has it already. A clause about the file gets its subject.
function wordsOf(error: unknown, name = ''): string {
  const words = (error instanceof Error ? error.message : String(error)).replace(/\.$/, '');
  const clause = name && words.startsWith(`${name}: `) ? words.slice(name.length + 2) : words;
  return /^(begins|is) /.test(clause) ? `it ${clause}` : clause;
}

function layersOn(): string[] {
  return layers.filter(({ isOn }) => isOn).map(({ id }) => id);
}

const firstAtoms = /^(ftyp|mdat|moov|free|skip|wide|RIFF)$/;

/// Of a file in which no reader finds a stream. One that was cut short has lost them, and says so.
function whyNothing({ verify }: Decoded): string {
  const finding = verify.findings?.find(({ severity }) => severity === 'damage');
  if (finding?.offset === 0 && !firstAtoms.test(finding.place ?? ''))
    return 'it begins neither like a movie, nor a RIFF file, nor a stream';
  const nothing = 'it holds nothing that was recorded beside a movie';
  return finding ? `${nothing}, and is damaged: ${finding.place} at offset ${finding.offset}, ${finding.message}` : nothing;
}

function debounced(action: () => void, delay: number): () => void {
  let timer: ReturnType<typeof setTimeout> | undefined;
  return () => {
    clearTimeout(timer);
    timer = setTimeout(action, delay);
  };
}
